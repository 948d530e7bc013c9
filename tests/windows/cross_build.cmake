# The test suite in a cross build (cmake/mingw-w64-i686.cmake): GoogleTest is
# compiled along from its sources, and each test program is one ctest test run
# through CMAKE_CROSSCOMPILING_EMULATOR (Wine), since every start of a
# Windows process there costs time.

set(TPLEX_GTEST_SOURCE_DIR /usr/src/googletest CACHE PATH
  "GoogleTest sources, compiled along in a cross build (Debian: googletest)")
if(NOT EXISTS ${TPLEX_GTEST_SOURCE_DIR}/CMakeLists.txt)
  message(FATAL_ERROR "No GoogleTest sources in ${TPLEX_GTEST_SOURCE_DIR}: "
    "install googletest or set TPLEX_GTEST_SOURCE_DIR")
endif()
set(BUILD_GMOCK OFF CACHE BOOL "" FORCE)
set(INSTALL_GTEST OFF CACHE BOOL "" FORCE)
add_subdirectory(${TPLEX_GTEST_SOURCE_DIR} ${CMAKE_BINARY_DIR}/googletest
  EXCLUDE_FROM_ALL SYSTEM)

# A folder of the build host as the test program sees it: under Wine the
# host's root is drive Z:, and a Windows path is one with backslashes.
function(tplex_target_path out host_path)
  if(CMAKE_CROSSCOMPILING_EMULATOR MATCHES "wine")
    string(REPLACE "/" "\\" path "Z:${host_path}")
  else()
    set(path ${host_path})
  endif()
  set(${out} ${path} PARENT_SCOPE)
endfunction()

# tplex_add_cross_test(NAME DATA_DIR): the whole program as one test.
function(tplex_add_cross_test name data_dir)
  tplex_target_path(data ${data_dir})
  add_test(NAME ${name} COMMAND ${name})
  set_tests_properties(${name} PROPERTIES ENVIRONMENT "TPLEX_TEST_DATA=${data}")
endfunction()
