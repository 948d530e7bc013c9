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

configure_file(cmake/tplex.pc.in ${PROJECT_BINARY_DIR}/tplex.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/tplex.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
