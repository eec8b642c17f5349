# The CMake package "webapi" and webapi.pc, for API libraries built elsewhere.
include(CMakePackageConfigHelpers)

set(package_dir "${CMAKE_INSTALL_LIBDIR}/cmake/webapi")
install(EXPORT webapi-targets NAMESPACE webapi:: DESTINATION "${package_dir}")
configure_package_config_file(
    "${PROJECT_SOURCE_DIR}/cmake/webapiConfig.cmake.in"
    "${PROJECT_BINARY_DIR}/webapiConfig.cmake"
    INSTALL_DESTINATION "${package_dir}")
write_basic_package_version_file("${PROJECT_BINARY_DIR}/webapiConfigVersion.cmake"
    COMPATIBILITY SameMajorVersion)
install(FILES
    "${PROJECT_BINARY_DIR}/webapiConfig.cmake"
    "${PROJECT_BINARY_DIR}/webapiConfigVersion.cmake"
    DESTINATION "${package_dir}")

configure_file("${PROJECT_SOURCE_DIR}/cmake/webapi.pc.in" "${PROJECT_BINARY_DIR}/webapi.pc" @ONLY)
install(FILES "${PROJECT_BINARY_DIR}/webapi.pc" DESTINATION "${CMAKE_INSTALL_LIBDIR}/pkgconfig")
