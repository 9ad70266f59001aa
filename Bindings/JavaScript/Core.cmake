# The C interface as a module of WebAssembly that asks the page for bytes and for nothing else.
add_executable(zulmetadata WasmHost.cpp)
target_link_libraries(zulmetadata PRIVATE zulmetadata_c)
zulm_project_options(zulmetadata)
set(exported malloc free zulm_last_error zulm_close zulm_container zulm_duration zulm_stream_count zulm_stream
  zulm_hidden_count zulm_hidden zulm_read_entries zulm_read_hidden zulm_states zulm_insight
  zulm_retime zulm_free_entries zulm_entry_count zulm_entry_times zulm_column_count zulm_column
  zulm_warning_count zulm_warning zulm_info zulm_verify zulm_dump zulm_text_bytes zulm_text_size zulm_free_text)
list(TRANSFORM exported PREPEND "_")
list(JOIN exported "," exported)
set_target_properties(zulmetadata PROPERTIES SUFFIX .wasm)
target_link_options(zulmetadata PRIVATE
  -O3 -sSTANDALONE_WASM --no-entry -sEXPORTED_FUNCTIONS=${exported}
  -sALLOW_MEMORY_GROWTH=1 -sMAXIMUM_MEMORY=2147483648 -sABORTING_MALLOC=0
  -sERROR_ON_UNDEFINED_SYMBOLS=0 -sWARN_ON_UNDEFINED_SYMBOLS=0) # the page's own; a test knows all of them

find_program(NODE node REQUIRED)
set(packaged ${ZULMETADATA_PACKAGE}/zulmetadata.wasm ${ZULMETADATA_PACKAGE}/zulmetadata.single.js)
add_custom_command(
  OUTPUT ${packaged}
  COMMAND ${CMAKE_COMMAND} -E copy ${package_sources} $<TARGET_FILE:zulmetadata> ${ZULMETADATA_PACKAGE}
  COMMAND ${CMAKE_COMMAND} -E rename ${ZULMETADATA_PACKAGE}/single.d.ts ${ZULMETADATA_PACKAGE}/zulmetadata.single.d.ts
  COMMAND ${NODE} ${CMAKE_CURRENT_SOURCE_DIR}/single.mjs ${ZULMETADATA_PACKAGE}
  WORKING_DIRECTORY ${CMAKE_CURRENT_SOURCE_DIR}
  DEPENDS zulmetadata single.mjs ${package_sources}
  COMMENT "Packing zulmetadata.js"
  VERBATIM)
add_custom_target(zulmetadata_package ALL DEPENDS ${packaged})
