# zulm_add_reliability_program(NAME SOURCE...): a program that the checks of this folder run. Built on demand, by
# `cmake --build --preset release --target reliability_programs`.
add_custom_target(reliability_programs)
function(zulm_add_reliability_program name)
  list(TRANSFORM ARGN PREPEND Reliability/Programs/)
  add_executable(${name} EXCLUDE_FROM_ALL ${ARGN})
  target_link_libraries(${name} PRIVATE ZULMetaData::Bridge)
  zulm_project_options(${name})
  set_target_properties(${name} PROPERTIES RUNTIME_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/Reliability)
  add_dependencies(reliability_programs ${name})
endfunction()
if(ZULMETADATA_RECORDER)
  add_dependencies(reliability_programs zulm-record ShownWindow) # the checks of the screen recorder
endif()
include(Reliability/FaultTests.cmake)
include(Reliability/HostileTests.cmake)
include(Reliability/ProofTests.cmake)
