# Installs the public header, the shared library, a CMake package (find_package(kelstat) gives
# kelstat::kelstat) and a pkg-config file.
include(CMakePackageConfigHelpers)

install(TARGETS kelstat EXPORT kelstatTargets
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(FILES ${PROJECT_SOURCE_DIR}/include/kelstat.h DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(EXPORT kelstatTargets NAMESPACE kelstat::
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kelstat)

configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/kelstatConfig.cmake.in
  ${PROJECT_BINARY_DIR}/kelstatConfig.cmake
  INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kelstat)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/kelstatConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${PROJECT_BINARY_DIR}/kelstatConfig.cmake
  ${PROJECT_BINARY_DIR}/kelstatConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kelstat)

configure_file(${PROJECT_SOURCE_DIR}/cmake/kelstat.pc.in ${PROJECT_BINARY_DIR}/kelstat.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/kelstat.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

if(KELSTAT_BUILD_TOOLS)
  install(TARGETS kelstat_cli RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()
