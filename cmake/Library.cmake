# The version of the binary interface, which programs are linked against. It goes up where something that they use is
# taken away or changes its shape, whatever the release is called; scripts/check-abi.sh tells.
set(ZULMETADATA_ABI_VERSION 1)

# zulm_library(TARGET NAME): what the libraries have in common. Programs know TARGET as ZULMetaData::NAME.
function(zulm_library target name)
  add_library(ZULMetaData::${name} ALIAS ${target})
  set_target_properties(${target} PROPERTIES
    EXPORT_NAME ${name}
    VERSION ${PROJECT_VERSION}
    SOVERSION ${ZULMETADATA_ABI_VERSION}
    CXX_VISIBILITY_PRESET hidden
    VISIBILITY_INLINES_HIDDEN ON)
  # A project around this one may have folders of the same names on its own list.
  target_include_directories(${target} BEFORE PRIVATE ${PROJECT_SOURCE_DIR})
  # Static ones go into shared libraries as well, such as the package for Python, without being compiled again.
  if(NOT EMSCRIPTEN)
    set_target_properties(${target} PROPERTIES POSITION_INDEPENDENT_CODE ON)
  endif()
  get_target_property(type ${target} TYPE)
  if(type STREQUAL "STATIC_LIBRARY")
    target_compile_definitions(${target} PUBLIC ZULMETADATA_STATIC)
  endif()
  # Each symbol says which version it is of, so that two can live in one process.
  if(type STREQUAL "SHARED_LIBRARY" AND CMAKE_SYSTEM_NAME STREQUAL "Linux")
    set(symbols ${PROJECT_BINARY_DIR}/symbols.map)
    file(CONFIGURE OUTPUT ${symbols} CONTENT "ZULMETADATA_@ZULMETADATA_ABI_VERSION@ { global: *; };\n" @ONLY)
    target_link_options(${target} PRIVATE LINKER:--version-script=${symbols})
    if(NOT ZULMETADATA_SANITIZERS) # what they need is linked into programs
      target_link_options(${target} PRIVATE LINKER:--no-undefined)
    endif()
  endif()
endfunction()
