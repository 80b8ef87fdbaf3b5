# Installs the build to a fresh prefix, builds the consumer project against it (through
# find_package, then through pkg-config) and runs it, then runs scenetool from the prefix.
# With PYTHON set, the installed Python package then imports the file as well.
# Variables: BUILD_DIR, SOURCE_DIR, WORK_DIR, COMPILER, CXX_FLAGS, LINKER_FLAGS, PLY_FILE,
# PYTHON and PYTHON_DIR (the package's folder under the prefix; both optional).
file(REMOVE_RECURSE ${WORK_DIR})
function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE result OUTPUT_VARIABLE output ERROR_VARIABLE output)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "failed: ${ARGN}\n${output}")
  endif()
  set(output "${output}" PARENT_SCOPE)
endfunction()
run(${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${WORK_DIR}/prefix)
run(${CMAKE_COMMAND} -S ${SOURCE_DIR} -B ${WORK_DIR}/build -G Ninja -DCMAKE_PREFIX_PATH=${WORK_DIR}/prefix
    -DCMAKE_CXX_COMPILER=${COMPILER} "-DCMAKE_CXX_FLAGS=${CXX_FLAGS}" "-DCMAKE_EXE_LINKER_FLAGS=${LINKER_FLAGS}")
run(${CMAKE_COMMAND} --build ${WORK_DIR}/build)
run(${WORK_DIR}/build/read_ply ${PLY_FILE})
message("${output}")
run(${WORK_DIR}/build/import_scene ${WORK_DIR}/prefix ${PLY_FILE})
message("${output}")
# The same through pkg-config, for build systems without CMake.
file(GLOB_RECURSE package_file ${WORK_DIR}/prefix/*/meshport.pc)
run(pkg-config --cflags --libs ${package_file})
separate_arguments(flags UNIX_COMMAND "${output}")
separate_arguments(compile_flags UNIX_COMMAND "${CXX_FLAGS}")
separate_arguments(link_flags UNIX_COMMAND "${LINKER_FLAGS}")
run(${COMPILER} ${compile_flags} ${SOURCE_DIR}/import_scene.cpp ${flags} ${link_flags} -o ${WORK_DIR}/import_scene_pc)
run(${WORK_DIR}/import_scene_pc ${WORK_DIR}/prefix ${PLY_FILE})
message("${output}")
# The programs work from the installed tree.
run(${WORK_DIR}/prefix/bin/scenetool import ${PLY_FILE})
message("${output}")
if(PYTHON)
  run(${CMAKE_COMMAND} -E env PYTHONPATH=${WORK_DIR}/prefix/${PYTHON_DIR} PYTHONDONTWRITEBYTECODE=1 ${PYTHON}
      ${SOURCE_DIR}/import_scene.py ${PLY_FILE})
  message("${output}")
endif()
