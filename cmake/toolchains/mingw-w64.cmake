# Cross-compiles for 64-bit Windows with Debian's MinGW-w64, posix-thread flavour (std::thread and
# std::mutex need it; the default alternative is the win32-thread one). Programs run under Wine.
#
# ZEL_WINDOWS_DEPS names the folder that scripts/build-xerces-windows.sh filled; it defaults to the
# one beside the build tree.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86_64)

set(ZEL_MINGW x86_64-w64-mingw32)
set(CMAKE_C_COMPILER ${ZEL_MINGW}-gcc-posix)
set(CMAKE_CXX_COMPILER ${ZEL_MINGW}-g++-posix)
set(CMAKE_RC_COMPILER ${ZEL_MINGW}-windres)
set(CMAKE_OBJDUMP ${ZEL_MINGW}-objdump)

if(NOT ZEL_WINDOWS_DEPS)
  # The default when the toolchain is used without the preset.
  get_filename_component(ZEL_WINDOWS_DEPS "${CMAKE_BINARY_DIR}/../windows-deps" ABSOLUTE)
endif()
set(ZEL_WINDOWS_DEPS "${ZEL_WINDOWS_DEPS}" CACHE PATH "Windows builds of the dependencies")

set(CMAKE_FIND_ROOT_PATH /usr/${ZEL_MINGW} ${ZEL_WINDOWS_DEPS}/xerces)
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
# The static Xerces brings its own package configuration, which knows its link dependencies.
set(CMAKE_FIND_PACKAGE_PREFER_CONFIG ON)
set(XercesC_DIR ${ZEL_WINDOWS_DEPS}/xerces/cmake)
# Debian's zlib for MinGW-w64 (libz-mingw-w64-dev): the static archive, so the DLL needs no zlib1.dll.
set(ZLIB_USE_STATIC_LIBS ON)

# The C and C++ runtimes and winpthread are linked in, so the DLL and the programs need nothing
# beside them.
set(CMAKE_EXE_LINKER_FLAGS_INIT "-static")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-static")

# Programs of the build run under Wine, in a prefix of the build tree's own that the test run starts
# once (see cmake/wine.cmake).
set(CMAKE_CROSSCOMPILING_EMULATOR
    /usr/bin/env WINEPREFIX=${CMAKE_BINARY_DIR}/wineprefix WINEDEBUG=-all wine)
