# Installs the library, its public headers, a CMake package and a pkg-config file, and packs the
# installed tree as a Debian package (cpack). The tool and the resource modules install
# themselves beside these (tools/owutil, resources).
#
#   cmake --install build/release --prefix /opt/owutils
#   cd build/release && cpack            # owutils_<version>_<arch>.deb
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

# The pkg-config file finds its prefix from its own place, so the installed tree can be moved
# (or installed with --prefix) and still be found with PKG_CONFIG_PATH.
file(RELATIVE_PATH OWUTILS_PC_TO_PREFIX /root/${CMAKE_INSTALL_LIBDIR}/pkgconfig /root)
configure_file(cmake/owutils.pc.in ${CMAKE_CURRENT_BINARY_DIR}/owutils.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/owutils.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# ---- Debian package ---------------------------------------------------------------------------
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME owutils)
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGE_VENDOR "OWUtils maintainers")
set(CPACK_PACKAGE_CONTACT "OWUtils maintainers <maintainers@owutils.example>")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY
  "Utility library of the data-protection client programs, with the owutil tool")
set(CPACK_PACKAGE_DESCRIPTION
  "OWUtils: secret-key verification over a menu of block ciphers and digests, file encryption\n\
and digests, resource modules and language selection, OEM branding data, an event logger, and\n\
string, path and file services. Includes the owutil command-line tool, the resource modules,\n\
the headers, a CMake package and a pkg-config file.")
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)  # dependencies from dpkg-shlibdeps
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_STRIP_FILES ON)
include(CPack)
