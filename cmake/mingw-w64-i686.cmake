# Cross toolchain: MinGW-w64, posix-threads variant, 32-bit Windows targets (x86).
set(CMAKE_SYSTEM_PROCESSOR i686)
set(lv_triple i686-w64-mingw32)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-w64-common.cmake)

# Nothing of this build runs on the build machine: Wine's 32-bit half is not installed there, so
# the tree holds the shipped binaries only (configure with -DLV_BUILD_TESTS=OFF).
