# What the MinGW-w64 toolchain files share; each sets TPLEX_MINGW_PREFIX and
# CMAKE_SYSTEM_PROCESSOR first, then includes this file.
set(CMAKE_SYSTEM_NAME Windows)

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

# No libgcc_s DLL, libstdc++-6.dll or libwinpthread-1.dll beside the
# programs: link their code in.
set(CMAKE_EXE_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")
set(CMAKE_SHARED_LINKER_FLAGS_INIT "-static -static-libgcc -static-libstdc++")

# Test programs run under Wine on a Linux host: TPLEX_WINE names the loader
# (tests/run.sh sets it), else the first of the given names found.
find_program(TPLEX_WINE NAMES ${TPLEX_WINE_NAMES})
if(TPLEX_WINE)
  set(CMAKE_CROSSCOMPILING_EMULATOR ${TPLEX_WINE})
endif()
