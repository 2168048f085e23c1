# cmake -DBUILD_DIR=... -DSTAGE_DIR=... -DCONFIG=... -P StagePackage.cmake
# Installs the runtime package (component "tarqvevyn") of BUILD_DIR into
# STAGE_DIR, quietly: it runs at every build and is mostly "Up-to-date".
execute_process(
  COMMAND ${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${STAGE_DIR} --component tarqvevyn --config ${CONFIG}
  RESULT_VARIABLE result
  OUTPUT_VARIABLE output
  ERROR_VARIABLE output)
if(NOT result EQUAL 0)
  message(FATAL_ERROR "Staging the runtime package failed:\n${output}")
endif()
