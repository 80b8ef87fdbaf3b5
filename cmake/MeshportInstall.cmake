# An installed, exported package: find_package(Meshport) gives meshport::base1.
if(CMAKE_CROSSCOMPILING)
  install(TARGETS base1 scenetool RUNTIME DESTINATION bin LIBRARY DESTINATION bin)
  return()
endif()

include(CMakePackageConfigHelpers)
install(TARGETS base1 meshport_fmt EXPORT MeshportTargets
  RUNTIME DESTINATION bin LIBRARY DESTINATION bin ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/meshport)
install(TARGETS scenetool RUNTIME DESTINATION bin)
install(DIRECTORY base/include/ DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/meshport/base)
install(EXPORT MeshportTargets NAMESPACE meshport:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
configure_package_config_file(cmake/MeshportConfig.cmake.in
  ${CMAKE_BINARY_DIR}/MeshportConfig.cmake INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
write_basic_package_version_file(${CMAKE_BINARY_DIR}/MeshportConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(FILES ${CMAKE_BINARY_DIR}/MeshportConfig.cmake ${CMAKE_BINARY_DIR}/MeshportConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
