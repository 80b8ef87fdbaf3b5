# The data the programs read at run time (importers.txt, the attribute description set) lies
# in data/ beside bin/, in the build tree as in the install tree.
file(GLOB_RECURSE meshport_data_files CONFIGURE_DEPENDS ${PROJECT_SOURCE_DIR}/data/*)
set(meshport_data_outputs)
foreach(source IN LISTS meshport_data_files)
  file(RELATIVE_PATH relative ${PROJECT_SOURCE_DIR}/data ${source})
  set(output ${CMAKE_BINARY_DIR}/data/${relative})
  add_custom_command(OUTPUT ${output} COMMAND ${CMAKE_COMMAND} -E copy_if_different ${source} ${output}
    DEPENDS ${source} COMMENT "Copying data/${relative}")
  list(APPEND meshport_data_outputs ${output})
endforeach()
add_custom_target(meshport_data ALL DEPENDS ${meshport_data_outputs})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/data/ DESTINATION data)
