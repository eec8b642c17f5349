# The host's objects with all that is in them, for tests and fuzz targets of what
# its library does not show.
if(NOT TARGET host-objects)
    get_target_property(host_sources taloplatform SOURCES)
    get_target_property(host_dir taloplatform SOURCE_DIR)
    list(TRANSFORM host_sources PREPEND "${host_dir}/")
    add_library(host-objects OBJECT ${host_sources})
    target_link_libraries(host-objects PUBLIC
        webapi-platform-headers webapi-build-options taloplatform-text ${CMAKE_DL_LIBS})
endif()
