# Cross build for 64-bit Windows with Debian's MinGW-w64 toolchain (packages
# g++-mingw-w64-x86-64 and binutils-mingw-w64-x86-64):
#
#   cmake -S . -B build-win64 -DCMAKE_TOOLCHAIN_FILE=cmake/mingw-w64-x86_64.cmake \
#         -DTPLEX_BUILD_TESTS=OFF
#   cmake --build build-win64
#
# gives build-win64/bin/tplex.dll (the same sixteen exports as the 32-bit
# one), its import library and bin/tplex.exe, needing only Windows' own DLLs.
# With the tests, ctest runs them under 64-bit Wine (wine64).
set(CMAKE_SYSTEM_PROCESSOR AMD64)
set(TPLEX_MINGW_PREFIX x86_64-w64-mingw32 CACHE STRING "Prefix of the cross tools")
set(TPLEX_WINE_NAMES wine64 wine)
include(${CMAKE_CURRENT_LIST_DIR}/mingw-w64-common.cmake)
