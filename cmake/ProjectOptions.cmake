# zulm_project_options(TARGET): warnings and instrumentation for a target of this project.
function(zulm_project_options target)
  target_compile_features(${target} PUBLIC cxx_std_20)
  set_target_properties(${target} PROPERTIES CXX_EXTENSIONS OFF)
  target_compile_options(${target} PRIVATE
    -Wall -Wextra -Wpedantic -Wconversion -Wsign-conversion -Wshadow -Wold-style-cast
    $<$<BOOL:${ZULMETADATA_WARNINGS_AS_ERRORS}>:-Werror>
    # GCC 12 takes inlined sums of short strings for copies beyond their bounds.
    "$<$<AND:$<CXX_COMPILER_ID:GNU>,$<NOT:$<CONFIG:Debug>>>:-Wno-array-bounds;-Wno-restrict;-Wno-stringop-overflow>")
  if(ZULMETADATA_SANITIZERS)
    target_compile_options(${target} PUBLIC
      -fsanitize=${ZULMETADATA_SANITIZERS} -fno-sanitize-recover=all -fno-omit-frame-pointer)
    target_link_options(${target} PUBLIC -fsanitize=${ZULMETADATA_SANITIZERS})
  endif()
  if(ZULMETADATA_COVERAGE)
    target_compile_options(${target} PUBLIC --coverage)
    target_link_options(${target} PUBLIC --coverage)
  endif()
endfunction()

# Neither ninja nor ccache looks into the list that an option names, so what is in it is an option as well.
if(ZULMETADATA_BUILD_FUZZERS)
  set(ignore_list ${PROJECT_SOURCE_DIR}/Fuzz/ignorelist.txt)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${ignore_list})
  file(SHA256 ${ignore_list} ignore_list_sum)
  add_compile_options(-fsanitize-ignorelist=${ignore_list} -DZULM_IGNORE_LIST=${ignore_list_sum})
endif()

# Without these options, ccache keeps nothing that was compiled with a precompiled header.
function(zulm_cache_precompiled_headers target)
  target_compile_options(${target} PRIVATE
    $<$<CXX_COMPILER_ID:GNU>:-fpch-preprocess> "$<$<CXX_COMPILER_ID:Clang>:SHELL:-Xclang -fno-pch-timestamp>")
endfunction()

# zulm_precompile_headers(TARGET HEADER...): compiles headers of other projects once for all sources of TARGET. A source
# still includes what it uses, since builds without precompiled headers must work too.
function(zulm_precompile_headers target)
  target_precompile_headers(${target} PRIVATE ${ARGN})
  zulm_cache_precompiled_headers(${target})
endfunction()

# zulm_reuse_precompiled_headers(TARGET OTHER): takes the headers that OTHER has compiled with the same options.
function(zulm_reuse_precompiled_headers target other)
  target_precompile_headers(${target} REUSE_FROM ${other})
  zulm_cache_precompiled_headers(${target})
endfunction()
