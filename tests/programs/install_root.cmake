# Installs into the private root, quiet when all is well.
execute_process(
    COMMAND "${CMAKE_COMMAND}" --install "${BUILD_DIR}"
    OUTPUT_VARIABLE output ERROR_VARIABLE output RESULT_VARIABLE result)
if(NOT result EQUAL 0)
    message(FATAL_ERROR "${output}")
endif()
