# Warnings are errors in every configuration.
add_library(meshport_warnings INTERFACE)
target_compile_options(meshport_warnings INTERFACE -Wall -Wextra -Werror)

find_program(MESHPORT_CCACHE ccache)
if(MESHPORT_CCACHE AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
  set(CMAKE_CXX_COMPILER_LAUNCHER ${MESHPORT_CCACHE})
endif()
