# Cross toolchain: MinGW-w64, posix-threads variant, 64-bit Windows targets.
set(CMAKE_SYSTEM_PROCESSOR x86_64)
set(lv_triple x86_64-w64-mingw32)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-w64-common.cmake)

# Tests and tools run under Wine on the build machine.
set(CMAKE_CROSSCOMPILING_EMULATOR "${CMAKE_CURRENT_LIST_DIR}/../scripts/wine-run")
