# What takes a compiler the longest here are the headers of GoogleTest, JsonCpp and
# the standard library. They are compiled once for all libraries and once for all
# test programs: position-independent code differs between the two.
#
# A file still includes what it uses: builds without WEBAPI_PRECOMPILE, and the
# clang-tidy of scripts/check, see it alone.

# targets_below(VARIABLE FOLDER): the targets of the folder and of those it adds.
function(targets_below variable folder)
    get_property(found DIRECTORY "${folder}" PROPERTY BUILDSYSTEM_TARGETS)
    get_property(folders DIRECTORY "${folder}" PROPERTY SUBDIRECTORIES)
    foreach(below IN LISTS folders)
        targets_below(more "${below}")
        list(APPEND found ${more})
    endforeach()
    set(${variable} "${found}" PARENT_SCOPE)
endfunction()

# ccache keeps what is compiled so only when it is told that it may.
function(let_ccache_keep target)
    get_target_property(launcher ${target} CXX_COMPILER_LAUNCHER)
    if(launcher MATCHES "ccache$")
        set_target_properties(${target} PROPERTIES CXX_COMPILER_LAUNCHER
            "env;CCACHE_SLOPPINESS=pch_defines,time_macros;${launcher}")
    endif()
    target_compile_options(${target} PRIVATE -fpch-preprocess)
endfunction()

function(use_precompiled target from)
    target_precompile_headers(${target} REUSE_FROM ${from})
    let_ccache_keep(${target})
endfunction()

function(precompile)
    targets_below(targets "${PROJECT_SOURCE_DIR}")
    set(source "${PROJECT_BINARY_DIR}/generated/precompiled.cpp")
    file(CONFIGURE OUTPUT "${source}" CONTENT "int main() { return 0; }\n")

    add_library(precompiled-library STATIC "${source}")
    target_link_libraries(precompiled-library PRIVATE jsoncpp_lib)
    target_precompile_headers(precompiled-library PRIVATE <json/json.h>)
    let_ccache_keep(precompiled-library)
    if(TARGET test-support)
        add_executable(precompiled-test "${source}")
        target_link_libraries(precompiled-test PRIVATE test-support)
        target_precompile_headers(precompiled-test PRIVATE
            <gtest/gtest.h> <json/json.h>
            <algorithm> <cstring> <fstream> <functional> <map> <memory> <set> <string> <vector>)
        let_ccache_keep(precompiled-test)
    endif()
    foreach(target IN LISTS targets)
        get_target_property(type ${target} TYPE)
        get_target_property(libraries ${target} LINK_LIBRARIES)
        if(type MATCHES "^(OBJECT|STATIC|SHARED|MODULE)_LIBRARY$")
            use_precompiled(${target} precompiled-library)
        elseif(type STREQUAL EXECUTABLE AND libraries MATCHES "GTest::gtest_main|relay-fixture")
            use_precompiled(${target} precompiled-test)
        endif()
    endforeach()
endfunction()
precompile()
