# Windows x86 DLL and executables, cross-built with MinGW-w64. The -posix
# compiler variant has std::thread and std::mutex; the -win32 one does not.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86)
set(CMAKE_C_COMPILER i686-w64-mingw32-gcc-posix)
set(CMAKE_CXX_COMPILER i686-w64-mingw32-g++-posix)
set(CMAKE_RC_COMPILER i686-w64-mingw32-windres)
set(CMAKE_FIND_ROOT_PATH /usr/i686-w64-mingw32)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
# Tests run under Wine; see .ci/wine-env for the prefix and server it expects.
set(CMAKE_CROSSCOMPILING_EMULATOR /usr/lib/wine/wine)
set(ALERTSUMMARY_OBJDUMP i686-w64-mingw32-objdump)
