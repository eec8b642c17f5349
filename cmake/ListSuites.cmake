# Writes TESTS: a CTest test for each suite of PROGRAM, with PREFIX before its name
# and with PROPERTIES.

execute_process(COMMAND "${PROGRAM}" --gtest_list_tests
    OUTPUT_VARIABLE listed RESULT_VARIABLE status)
if(NOT status EQUAL 0)
    message(FATAL_ERROR "${PROGRAM} does not list its tests: ${status}\n${listed}")
endif()

list(FIND PROPERTIES TIMEOUT place)
if(NOT place EQUAL -1)
    math(EXPR place "${place} + 1")
    list(GET PROPERTIES ${place} seconds)
    math(EXPR seconds "${seconds} * 5")
    list(REMOVE_AT PROPERTIES ${place})
    list(INSERT PROPERTIES ${place} ${seconds})
endif()
list(JOIN PROPERTIES " " properties)

# Cases are indented; a suite's name ends with a dot and may have a comment.
string(REGEX MATCHALL "(^|\n)[A-Za-z_][A-Za-z0-9_/]*\\.( +#[^\n]*)?\n" suites "${listed}")
if(NOT suites)
    message(FATAL_ERROR "${PROGRAM} has no tests")
endif()
set(script)
foreach(suite IN LISTS suites)
    string(REGEX REPLACE "^\n?([A-Za-z0-9_/]+)\\..*" "\\1" suite "${suite}")
    string(APPEND script
        "add_test([=[${PREFIX}${suite}]=] [=[${PROGRAM}]=] [=[--gtest_filter=${suite}.*]=])\n"
        "set_tests_properties([=[${PREFIX}${suite}]=] PROPERTIES ${properties})\n")
endforeach()
file(WRITE "${TESTS}" "${script}")
