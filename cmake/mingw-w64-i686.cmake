# Cross build for 32-bit Windows on x86 with Debian's MinGW-w64 toolchain
# (packages g++-mingw-w64-i686 and binutils-mingw-w64-i686):
#
#   cmake -S . -B build-win32 -DCMAKE_TOOLCHAIN_FILE=cmake/mingw-w64-i686.cmake \
#         -DTPLEX_BUILD_TESTS=OFF
#   cmake --build build-win32
#
# gives build-win32/bin/tplex.dll, its import library build-win32/libtplex.dll.a
# and build-win32/bin/tplex.exe. Every program is linked with the C runtime
# support and libstdc++ built in, so it needs nothing but Windows' own DLLs.
# With the tests (Debian's googletest sources needed), ctest runs the test
# programs under Wine when it is installed: tests/run.sh windows does all that.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86)

set(TPLEX_MINGW_PREFIX i686-w64-mingw32 CACHE STRING "Prefix of the cross tools")
# The compilers of the POSIX thread model: the other one (win32) has no
# std::mutex, which GoogleTest needs.
set(CMAKE_C_COMPILER ${TPLEX_MINGW_PREFIX}-gcc-posix)
set(CMAKE_CXX_COMPILER ${TPLEX_MINGW_PREFIX}-g++-posix)
set(CMAKE_RC_COMPILER ${TPLEX_MINGW_PREFIX}-windres)
set(CMAKE_OBJDUMP ${TPLEX_MINGW_PREFIX}-objdump)

set(CMAKE_FIND_ROOT_PATH /usr/${TPLEX_MINGW_PREFIX})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)

# No libgcc_s_dw2-1.dll, libstdc++-6.dll or libwinpthread-1.dll beside the
# programs: link their code in.
set(CMAKE_EXE_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")

# Test programs run under Wine on a Linux host.
find_program(TPLEX_WINE wine)
if(TPLEX_WINE)
  set(CMAKE_CROSSCOMPILING_EMULATOR ${TPLEX_WINE})
endif()
