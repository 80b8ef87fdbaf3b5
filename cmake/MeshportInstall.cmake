# An installed, exported package: find_package(Meshport) gives meshport::base1 and
# meshport::ply_parser. Every public header lies in one folder, include/meshport, so a
# consumer spells its includes as the tree does ("b_stream.h", "ply_parser.h").
if(CMAKE_CROSSCOMPILING)
  install(TARGETS base1 scenetool scene_ply RUNTIME DESTINATION bin LIBRARY DESTINATION bin)
  return()
endif()

include(CMakePackageConfigHelpers)
set(MESHPORT_INCLUDE_DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/meshport)
install(TARGETS base1 ply_parser EXPORT MeshportTargets
  RUNTIME DESTINATION bin LIBRARY DESTINATION bin ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(TARGETS scenetool RUNTIME DESTINATION bin)
install(TARGETS scene_ply LIBRARY DESTINATION bin)
file(GLOB meshport_public_headers ${PROJECT_SOURCE_DIR}/base/include/*.h ${PROJECT_SOURCE_DIR}/base/include/stream/*.h
     ${PROJECT_SOURCE_DIR}/plugins/ply/ply_*.h)
install(FILES ${meshport_public_headers} DESTINATION ${MESHPORT_INCLUDE_DESTINATION})
install(EXPORT MeshportTargets NAMESPACE meshport:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
configure_package_config_file(cmake/MeshportConfig.cmake.in
  ${CMAKE_BINARY_DIR}/MeshportConfig.cmake INSTALL_DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
write_basic_package_version_file(${CMAKE_BINARY_DIR}/MeshportConfigVersion.cmake COMPATIBILITY SameMinorVersion)
install(FILES ${CMAKE_BINARY_DIR}/MeshportConfig.cmake ${CMAKE_BINARY_DIR}/MeshportConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/Meshport)
