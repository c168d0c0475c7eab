# Writes LIST, which makes a test of each suite of the test program PROGRAM, with PROPERTIES.
execute_process(COMMAND "${PROGRAM}" --gtest_list_tests OUTPUT_VARIABLE listing COMMAND_ERROR_IS_FATAL ANY)
string(REPLACE "\n" ";" lines "${listing}")
set(tests "")
foreach(line IN LISTS lines)
  # A suite stands at the beginning of a line and ends in a full stop; its cases are indented.
  if(line MATCHES "^([^ ]+)\\.( |$)")
    set(suite "${CMAKE_MATCH_1}")
    string(APPEND tests "add_test([==[${suite}]==] [==[${PROGRAM}]==] [==[--gtest_filter=${suite}.*]==])\n"
                        "set_tests_properties([==[${suite}]==] PROPERTIES ${PROPERTIES})\n")
  endif()
endforeach()
if(tests STREQUAL "")
  message(FATAL_ERROR "${PROGRAM} has no tests")
endif()
file(WRITE "${LIST}" "${tests}")
