# In place of GoogleTest's gtest_discover_tests, which makes a CTest test of each
# case: one of each suite. A program under a sanitizer takes longer to start than most
# cases take to run.
#
# The time limit of a case becomes one of the suite, five times as long. A folder whose
# cases need a process each switches WEBAPI_TESTS_BY_SUITE off.

# gtest_discover_tests(TARGET [TEST_PREFIX PREFIX] [DISCOVERY_TIMEOUT SECONDS]
#     [PROPERTIES NAME VALUE...])
function(gtest_discover_tests target)
    if(NOT WEBAPI_TESTS_BY_SUITE)
        _gtest_discover_tests(${ARGV})
        return()
    endif()
    cmake_parse_arguments(PARSE_ARGV 1 arg "" "TEST_PREFIX;DISCOVERY_TIMEOUT" "PROPERTIES")
    if(arg_UNPARSED_ARGUMENTS)
        message(FATAL_ERROR "not known of suites: ${arg_UNPARSED_ARGUMENTS}")
    endif()
    set(tests "${CMAKE_CURRENT_BINARY_DIR}/${target}-suites.cmake")
    add_custom_command(TARGET ${target} POST_BUILD BYPRODUCTS "${tests}"
        COMMAND "${CMAKE_COMMAND}"
            "-DPROGRAM=$<TARGET_FILE:${target}>"
            "-DPREFIX=${arg_TEST_PREFIX}"
            "-DPROPERTIES=${arg_PROPERTIES}"
            "-DTESTS=${tests}"
            -P "${PROJECT_SOURCE_DIR}/cmake/ListSuites.cmake"
        VERBATIM)
    set(entrance "${CMAKE_CURRENT_BINARY_DIR}/${target}-tests.cmake")
    file(CONFIGURE OUTPUT "${entrance}" @ONLY CONTENT [=[
if(EXISTS "@tests@")
    include("@tests@")
else()
    add_test(@target@_NOT_BUILT @target@_NOT_BUILT)
endif()
]=])
    set_property(DIRECTORY APPEND PROPERTY TEST_INCLUDE_FILES "${entrance}")
endfunction()
