# tarqvevyn_add_golden_test(NAME <test> PLUGIN <target> TIMELINE <file> REFERENCES <folder>
#                           [SIZE <W>x<H>] [FPS <n>] [TOLERANCE <n>] [ALLOW_PIXELS <n>]
#                           [IMAGES <name>=<file> ...])
#
# A test that keeps an effect's pictures from changing unnoticed: the kit's
# vi-player plays the plug-in in fixed steps along the timeline and holds
# every frame against its reference picture in REFERENCES (vi-player
# --compare). While REFERENCES holds no frame, the test is named
# "<test> (no references yet: records them)" and makes this render the
# references, and passes; from then on it is "<test>" and compares. Run ctest
# with VI_UPDATE_GOLDENS=1 to make a new render the references. The frames
# and the diff pictures of a failing frame go to <binary dir>/<test>-frames.
# Relative paths are taken from the current source folder.

function(tarqvevyn_add_golden_test)
  cmake_parse_arguments(PARSE_ARGV 0 arg "" "NAME;PLUGIN;TIMELINE;REFERENCES;SIZE;FPS;TOLERANCE;ALLOW_PIXELS"
    "IMAGES")
  foreach(required NAME PLUGIN TIMELINE REFERENCES)
    if(NOT arg_${required})
      message(FATAL_ERROR "tarqvevyn_add_golden_test: ${required} is missing")
    endif()
  endforeach()
  if(arg_UNPARSED_ARGUMENTS)
    message(FATAL_ERROR "tarqvevyn_add_golden_test: unknown arguments: ${arg_UNPARSED_ARGUMENTS}")
  endif()
  if(NOT TARGET tarqvevyn::vi-player)
    message(FATAL_ERROR "tarqvevyn_add_golden_test needs the kit's vi-player, which this install of tarqvevyn lacks")
  endif()

  get_filename_component(timeline "${arg_TIMELINE}" ABSOLUTE BASE_DIR "${CMAKE_CURRENT_SOURCE_DIR}")
  get_filename_component(references "${arg_REFERENCES}" ABSOLUTE BASE_DIR "${CMAKE_CURRENT_SOURCE_DIR}")
  set(player_arguments --quiet --timeline "${timeline}" --out "${CMAKE_CURRENT_BINARY_DIR}/${arg_NAME}-frames"
    --compare "${references}")
  foreach(option SIZE FPS TOLERANCE ALLOW_PIXELS)
    if(DEFINED arg_${option})
      string(TOLOWER "--${option}" flag)
      string(REPLACE "_" "-" flag "${flag}")
      list(APPEND player_arguments ${flag} "${arg_${option}}")
    endif()
  endforeach()
  foreach(image IN LISTS arg_IMAGES)
    if(NOT image MATCHES "^([^=]+)=(.+)$")
      message(FATAL_ERROR "tarqvevyn_add_golden_test: IMAGES takes NAME=FILE, not '${image}'")
    endif()
    get_filename_component(file "${CMAKE_MATCH_2}" ABSOLUTE BASE_DIR "${CMAKE_CURRENT_SOURCE_DIR}")
    list(APPEND player_arguments --image "${CMAKE_MATCH_1}=${file}")
  endforeach()

  # Which test there is depends on the reference folder when ctest starts,
  # not when the project was configured: ctest reads this file at every run.
  set(command "[==[$<TARGET_FILE:tarqvevyn::vi-player>]==]")
  foreach(argument IN LISTS player_arguments)
    string(APPEND command " [==[${argument}]==]")
  endforeach()
  string(APPEND command " [==[$<TARGET_FILE:${arg_PLUGIN}>]==]")
  set(recording "${arg_NAME} (no references yet: records them)")
  set(updating "${arg_NAME} (VI_UPDATE_GOLDENS: records them)")
  set(tests "${CMAKE_CURRENT_BINARY_DIR}/${arg_NAME}-golden-test.cmake")
  file(GENERATE OUTPUT "${tests}" CONTENT "file(GLOB references [==[${references}/frame-*.png]==])
set(name [==[${arg_NAME}]==])
set(update)
if(NOT references)
  set(name [==[${recording}]==])
  set(update --update)
elseif(\"\$ENV{VI_UPDATE_GOLDENS}\")
  set(name [==[${updating}]==])
  set(update --update)
endif()
add_test(\"\${name}\" ${command} \${update})
set_tests_properties(\"\${name}\" PROPERTIES TIMEOUT 600)
")
  set_property(DIRECTORY APPEND PROPERTY TEST_INCLUDE_FILES "${tests}")
endfunction()
