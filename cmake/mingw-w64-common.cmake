# The part of the MinGW-w64 (posix-threads) cross toolchains that both targets share; the including
# file sets CMAKE_SYSTEM_PROCESSOR and lv_triple first.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_C_COMPILER ${lv_triple}-gcc-posix)
set(CMAKE_CXX_COMPILER ${lv_triple}-g++-posix)
set(CMAKE_RC_COMPILER ${lv_triple}-windres)
set(CMAKE_FIND_ROOT_PATH /usr/${lv_triple})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
