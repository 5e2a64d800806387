# Installs the library, its public headers, a CMake package and a pkg-config file.
include(CMakePackageConfigHelpers)

install(TARGETS OWUtils EXPORT OWUtilsTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
install(DIRECTORY include/owutils DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

install(EXPORT OWUtilsTargets NAMESPACE OWUtils:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/OWUtils)
configure_package_config_file(cmake/OWUtilsConfig.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/OWUtilsConfig.cmake
  INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/OWUtils)
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/OWUtilsConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/OWUtilsConfig.cmake ${CMAKE_CURRENT_BINARY_DIR}/OWUtilsConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/OWUtils)

configure_file(cmake/owutils.pc.in ${CMAKE_CURRENT_BINARY_DIR}/owutils.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/owutils.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
