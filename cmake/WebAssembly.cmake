# What is different where the library is built for WebAssembly: only what the JavaScript module needs is, and without
# libraries of this machine, of which the headers alone can be used.

set(ZULMETADATA_BUILD_TESTS OFF)
set(ZULMETADATA_BUILD_EXAMPLES OFF)
set(ZULMETADATA_IMAGE_CODECS OFF)

if(NOT CMAKE_BUILD_TYPE)
  set(CMAKE_BUILD_TYPE Release)
endif()
set(CMAKE_CXX_FLAGS_RELEASE "-O3 -DNDEBUG")
add_compile_options(-fwasm-exceptions)
add_link_options(-fwasm-exceptions)

# zulm_host_headers(TARGET HEADER): TARGET gives the folder of HEADER, which is found where this machine has it.
function(zulm_host_headers target header)
  cmake_path(GET header PARENT_PATH folder)
  string(MAKE_C_IDENTIFIER "ZULMETADATA_${folder}_FOLDER" place)
  find_path(${place} ${header} PATHS /usr/include /usr/local/include NO_CMAKE_FIND_ROOT_PATH REQUIRED)
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/headers)
  file(CREATE_LINK ${${place}}/${folder} ${PROJECT_BINARY_DIR}/headers/${folder} SYMBOLIC)
  add_library(${target} INTERFACE IMPORTED GLOBAL)
  target_include_directories(${target} INTERFACE ${PROJECT_BINARY_DIR}/headers)
endfunction()
