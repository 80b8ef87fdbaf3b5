# An installed, exported package: find_package(Meshport) gives meshport::base1,
# meshport::scene and meshport::ply_parser, and lib/pkgconfig/meshport.pc the same for other
# build systems. Every public header lies in one folder, include/meshport, so a consumer
# spells its includes as the tree does ("b_stream.h", "scene_factory.h", "ply_parser.h").
# The programs keep the run-time layout: bin/ (scenetool, base1, the scene_* plug-ins) beside
# data/; the static libraries and the package files go to lib/.
if(CMAKE_CROSSCOMPILING)
  install(TARGETS base1 scenetool scene_ply RUNTIME DESTINATION bin LIBRARY DESTINATION bin)
  return()
endif()

include(CMakePackageConfigHelpers)
set(MESHPORT_INCLUDE_DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/meshport)
install(TARGETS base1 scene ply_parser EXPORT MeshportTargets
  RUNTIME DESTINATION bin LIBRARY DESTINATION bin ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(TARGETS scenetool RUNTIME DESTINATION bin)
install(TARGETS scene_ply LIBRARY DESTINATION bin)
file(GLOB meshport_public_headers ${PROJECT_SOURCE_DIR}/base/include/*.h ${PROJECT_SOURCE_DIR}/base/include/stream/*.h
     ${PROJECT_SOURCE_DIR}/scene/include/*.h ${PROJECT_SOURCE_DIR}/plugins/ply/ply_*.h)
install(FILES ${meshport_public_headers} DESTINATION ${MESHPORT_INCLUDE_DESTINATION})
install(EXPORT MeshportTargets NAMESPACE meshport:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
configure_package_config_file(cmake/MeshportConfig.cmake.in
  ${CMAKE_BINARY_DIR}/MeshportConfig.cmake INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
write_basic_package_version_file(${CMAKE_BINARY_DIR}/MeshportConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(FILES ${CMAKE_BINARY_DIR}/MeshportConfig.cmake ${CMAKE_BINARY_DIR}/MeshportConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
configure_file(cmake/meshport.pc.in ${CMAKE_BINARY_DIR}/meshport.pc @ONLY)
install(FILES ${CMAKE_BINARY_DIR}/meshport.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
