# Warnings for the project's own targets. -Werror only where the project's presets and CI
# ask for it, so that a user's newer compiler with new warnings still builds the package.
option(MESHPORT_WARNINGS_AS_ERRORS "Treat compiler warnings as errors" OFF)

function(meshport_warnings target)
  target_compile_options(${target} PRIVATE -Wall -Wextra $<$<BOOL:${MESHPORT_WARNINGS_AS_ERRORS}>:-Werror>)
endfunction()

find_program(MESHPORT_CCACHE ccache)
if(MESHPORT_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
  set(CMAKE_CXX_COMPILER_LAUNCHER ${MESHPORT_CCACHE})
endif()
