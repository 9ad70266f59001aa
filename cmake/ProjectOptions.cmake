# zulm_project_options(TARGET): warnings and instrumentation for a target of this project.
function(zulm_project_options target)
  target_compile_features(${target} PUBLIC cxx_std_20)
  set_target_properties(${target} PROPERTIES CXX_EXTENSIONS OFF)
  target_compile_options(${target} PRIVATE
    -Wall -Wextra -Wpedantic -Wconversion -Wsign-conversion -Wshadow -Wold-style-cast
    $<$<BOOL:${ZULMETADATA_WARNINGS_AS_ERRORS}>:-Werror>)
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
