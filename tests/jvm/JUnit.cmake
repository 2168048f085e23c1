# JUnit 5 suites for CTest: vi_add_junit(TARGET CLASSPATH SOURCES...) compiles
# the sources against JUnit and CLASSPATH into the folder's classes/ as part of
# `all`, and sets VI_JUNIT: the java arguments, after the system properties,
# that run the suites (add --select-class).
find_package(Java 17 REQUIRED COMPONENTS Development Runtime)
set(VI_JUNIT_JAR /usr/share/java/junit-platform-console-standalone.jar)
function(vi_add_junit target classpath)
  set(classes ${CMAKE_CURRENT_BINARY_DIR}/classes)
  add_custom_command(OUTPUT ${classes}.stamp
    COMMAND ${CMAKE_COMMAND} -E remove_directory ${classes}
    COMMAND ${Java_JAVAC_EXECUTABLE} -Xlint:all -Werror -d ${classes} -cp ${VI_JUNIT_JAR}:${classpath} ${ARGN}
    COMMAND ${CMAKE_COMMAND} -E touch ${classes}.stamp
    DEPENDS ${ARGN} ${classpath})
  add_custom_target(${target} ALL DEPENDS ${classes}.stamp)
  set(VI_JUNIT -jar ${VI_JUNIT_JAR} --disable-banner --disable-ansi-colors --fail-if-no-tests
    --details=tree --class-path ${classes}:${classpath} PARENT_SCOPE)
endfunction()
