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
# programs under 32-bit Wine when it is installed: tests/run.sh windows does
# all that.
set(CMAKE_SYSTEM_PROCESSOR x86)
set(TPLEX_MINGW_PREFIX i686-w64-mingw32 CACHE STRING "Prefix of the cross tools")
set(TPLEX_WINE_NAMES wine)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-w64-common.cmake)
