# The Windows build's system headers, parsed once and shared by every C++ target.
#
# Most of a translation unit's compile time went to parsing <windows.h> and <shlobj.h> again, some
# 200 times. lv_pch compiles them once with the project's options; every other target of the
# build reuses that header (REUSE_FROM), which the compiler takes in front of each file. A target
# whose options differ still builds: the compiler then parses the headers itself. The host build
# keeps plain compiles, so that portable code that leans on <windows.h> without including it still
# fails there.
add_library(lv_pch STATIC ${CMAKE_CURRENT_LIST_DIR}/precompiled.cpp)
target_link_libraries(lv_pch PRIVATE lv_options)
# The system's headers only: with the standard library's string headers in it as well, the
# compiler reports its own inlined wmemcpy (-Warray-bounds) in files that copy short strings.
target_precompile_headers(lv_pch PRIVATE <windows.h> <shlobj.h> <commctrl.h> <objidl.h>)

# Every library and program below directory that compiles C++, except GoogleTest's own.
function(lv_share_precompiled_headers directory)
    get_property(targets DIRECTORY ${directory} PROPERTY BUILDSYSTEM_TARGETS)
    foreach(target ${targets})
        get_target_property(type ${target} TYPE)
        if(target STREQUAL "lv_pch" OR target MATCHES "^(gtest|gmock)" OR
           NOT type MATCHES "^(EXECUTABLE|STATIC_LIBRARY|SHARED_LIBRARY|MODULE_LIBRARY)$")
            continue()
        endif()
        target_precompile_headers(${target} REUSE_FROM lv_pch)
    endforeach()
    get_property(subdirectories DIRECTORY ${directory} PROPERTY SUBDIRECTORIES)
    foreach(subdirectory ${subdirectories})
        lv_share_precompiled_headers(${subdirectory})
    endforeach()
endfunction()
