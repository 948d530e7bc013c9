# Install layout: headers, both libraries, pkg-config file, CMake package.
include(CMakePackageConfigHelpers)

install(DIRECTORY include/tplex DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(TARGETS tplex tplex_static EXPORT tplexTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(EXPORT tplexTargets NAMESPACE tplex::
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/tplex)

configure_package_config_file(cmake/tplexConfig.cmake.in
  ${PROJECT_BINARY_DIR}/tplexConfig.cmake
  INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/tplex)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/tplexConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/tplexConfig.cmake
  ${PROJECT_BINARY_DIR}/tplexConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/tplex)

# The pkg-config file finds its prefix from its own place (pkg-config's
# ${pcfiledir}), so it stays right when `cmake --install --prefix` installs
# somewhere else than the prefix configured.
if(IS_ABSOLUTE "${CMAKE_INSTALL_LIBDIR}")
  set(TPLEX_PC_PREFIX "${CMAKE_INSTALL_PREFIX}")
  set(TPLEX_PC_LIBDIR "${CMAKE_INSTALL_LIBDIR}")
else()
  file(RELATIVE_PATH pc_up "/p/${CMAKE_INSTALL_LIBDIR}/pkgconfig" "/p")
  string(REGEX REPLACE "/$" "" pc_up "${pc_up}")
  set(TPLEX_PC_PREFIX "\${pcfiledir}/${pc_up}")
  set(TPLEX_PC_LIBDIR "\${prefix}/${CMAKE_INSTALL_LIBDIR}")
endif()
if(IS_ABSOLUTE "${CMAKE_INSTALL_INCLUDEDIR}")
  set(TPLEX_PC_INCLUDEDIR "${CMAKE_INSTALL_INCLUDEDIR}")
else()
  set(TPLEX_PC_INCLUDEDIR "\${prefix}/${CMAKE_INSTALL_INCLUDEDIR}")
endif()
configure_file(cmake/tplex.pc.in ${PROJECT_BINARY_DIR}/tplex.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/tplex.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
