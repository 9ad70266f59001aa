# The module for JavaScript, built by another compiler in a build of its own. Needs emscripten.
set(ZULM_BUILD_VIEWER AUTO CACHE STRING "Build the viewer: ON, OFF, or AUTO for where em++ and npm are there")
set_property(CACHE ZULM_BUILD_VIEWER PROPERTY STRINGS AUTO ON OFF)

find_program(EM_CONFIG em-config)
find_program(EMXX em++)
find_program(NODE node)
find_program(NPM npm)
mark_as_advanced(EM_CONFIG EMXX NODE NPM)
if(ZULM_BUILD_VIEWER STREQUAL "AUTO")
  if(EM_CONFIG AND EMXX AND NODE AND NPM)
    set(ZULM_VIEWER ON)
  else()
    set(ZULM_VIEWER OFF)
  endif()
else()
  set(ZULM_VIEWER ${ZULM_BUILD_VIEWER})
endif()
if(ZULM_VIEWER AND NOT (EM_CONFIG AND EMXX AND NODE AND NPM))
  message(FATAL_ERROR "The viewer needs em++, node and npm, which scripts/install.sh viewer installs")
endif()
set(ZULM_VIEWER ${ZULM_VIEWER} PARENT_SCOPE)
if(NOT ZULM_VIEWER)
  return()
endif()

include(ExternalProject)
ExternalProject_Add(viewer_wasm
  SOURCE_DIR ${PROJECT_SOURCE_DIR}
  BINARY_DIR ${CMAKE_CURRENT_BINARY_DIR}/wasm
  PREFIX ${CMAKE_CURRENT_BINARY_DIR}/stamps
  CMAKE_ARGS -DCMAKE_TOOLCHAIN_FILE=${PROJECT_SOURCE_DIR}/cmake/wasm32-emscripten.cmake
    -DZULMETADATA_PACKAGE=${ZULMETADATA_PACKAGE} -DCMAKE_UNITY_BUILD=ON -DCMAKE_UNITY_BUILD_BATCH_SIZE=8
  BUILD_COMMAND ${CMAKE_COMMAND} --build <BINARY_DIR> --target zulmetadata_package
  BUILD_ALWAYS ON
  BUILD_BYPRODUCTS ${ZULMETADATA_PACKAGE}/zulmetadata.wasm ${ZULMETADATA_PACKAGE}/zulmetadata.single.js
  INSTALL_COMMAND "")
