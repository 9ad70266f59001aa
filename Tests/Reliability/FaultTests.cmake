# What the checks of faults run: recorders that are killed, and a library that lets system calls fail.
zulm_add_reliability_program(recorder recorder.cpp)
target_link_libraries(recorder PRIVATE ZULMetaData::Session)
zulm_add_reliability_program(library library.cpp)

# For LD_PRELOAD: it stands in front of the C library, not on top of this one.
add_library(FaultShim MODULE EXCLUDE_FROM_ALL Reliability/Programs/FaultShim.cpp)
target_link_libraries(FaultShim PRIVATE ${CMAKE_DL_LIBS})
zulm_project_options(FaultShim)
set_target_properties(FaultShim PROPERTIES LIBRARY_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/Reliability PREFIX "")
add_dependencies(reliability_programs FaultShim)
