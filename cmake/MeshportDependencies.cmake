# Third-party libraries, all from Debian packages. The Windows cross build has no MinGW
# packages of the header-only libraries, so it reads their Debian headers through a
# directory that holds nothing else (the host's /usr/include must stay out of its path),
# under the same target names that the packages' own CMake files give.
find_package(ZLIB REQUIRED)

if(CMAKE_CROSSCOMPILING)
  set(MESHPORT_HOST_HEADERS ${CMAKE_BINARY_DIR}/host-headers)
  file(MAKE_DIRECTORY ${MESHPORT_HOST_HEADERS})
  foreach(dir fmt CLI rapidjson)
    if(NOT EXISTS ${MESHPORT_HOST_HEADERS}/${dir})
      file(CREATE_LINK /usr/include/${dir} ${MESHPORT_HOST_HEADERS}/${dir} SYMBOLIC)
    endif()
  endforeach()
  add_library(fmt::fmt INTERFACE IMPORTED)
  target_include_directories(fmt::fmt SYSTEM INTERFACE ${MESHPORT_HOST_HEADERS})
  target_compile_definitions(fmt::fmt INTERFACE FMT_HEADER_ONLY)
  add_library(CLI11::CLI11 INTERFACE IMPORTED)
  target_include_directories(CLI11::CLI11 SYSTEM INTERFACE ${MESHPORT_HOST_HEADERS})
  set(MESHPORT_RAPIDJSON_INCLUDE ${MESHPORT_HOST_HEADERS})
else()
  find_package(fmt REQUIRED)
  find_package(CLI11 REQUIRED)
  find_path(MESHPORT_RAPIDJSON_INCLUDE rapidjson/document.h REQUIRED)
  find_path(MESHPORT_MURMURHASH_INCLUDE murmurhash.h REQUIRED)
  find_library(MESHPORT_MURMURHASH_LIBRARY murmurhash REQUIRED)
  find_package(pugixml REQUIRED)
endif()
# Header-only, used by scenetool alone; never part of the installed package.
add_library(meshport_rapidjson INTERFACE)
target_include_directories(meshport_rapidjson SYSTEM INTERFACE ${MESHPORT_RAPIDJSON_INCLUDE})

if(MESHPORT_BUILD_TESTS)
  find_package(GTest REQUIRED)
  include(GoogleTest)
endif()
if(MESHPORT_BUILD_BENCH)
  find_package(benchmark REQUIRED)
endif()
