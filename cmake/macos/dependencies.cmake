# Stands in for the packages that the project looks for: their headers are this machine's, and what is linked is a text
# stub, which names what the library has.
macro(zulm_macos_package method package)
  set(${package}_FOUND TRUE)
endmacro()
cmake_language(SET_DEPENDENCY_PROVIDER zulm_macos_package SUPPORTED_METHODS FIND_PACKAGE)

foreach(target IN ITEMS PNG::PNG TIFF::TIFF CLI11::CLI11 nlohmann_json::nlohmann_json fmt::fmt-header-only
                     Threads::Threads ZLIB::ZLIB)
  add_library(${target} INTERFACE IMPORTED)
endforeach()
target_link_libraries(PNG::PNG INTERFACE ${ZULM_MACOS_DEPENDENCIES}/lib/libpng.tbd)
target_link_libraries(TIFF::TIFF INTERFACE ${ZULM_MACOS_DEPENDENCIES}/lib/libtiff.tbd)
target_link_libraries(ZLIB::ZLIB INTERFACE ${ZULM_MACOS_DEPENDENCIES}/lib/libz.tbd)
target_compile_definitions(fmt::fmt-header-only INTERFACE FMT_HEADER_ONLY=1)

set(ZULMETADATA_FMT_TARGET fmt::fmt-header-only)
set(RE2_LIBRARY ${ZULM_MACOS_DEPENDENCIES}/lib/libre2.tbd)
set(UTF8PROC_LIBRARY ${ZULM_MACOS_DEPENDENCIES}/lib/libutf8proc.tbd)
