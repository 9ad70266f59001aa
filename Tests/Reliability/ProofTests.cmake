# What the checks of allocation failures run: one program for the library, and for the tool a library for LD_PRELOAD.
zulm_add_reliability_program(allocation_failures allocation_failures.cpp FailingAllocations.cpp)
target_link_libraries(allocation_failures PRIVATE ZULMetaData::Session)

add_library(AllocationShim MODULE EXCLUDE_FROM_ALL
  Reliability/Programs/AllocationShim.cpp Reliability/Programs/FailingAllocations.cpp)
target_include_directories(AllocationShim PRIVATE ${PROJECT_SOURCE_DIR})
target_link_libraries(AllocationShim PRIVATE ${CMAKE_DL_LIBS})
zulm_project_options(AllocationShim)
set_target_properties(AllocationShim PROPERTIES
  LIBRARY_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/Reliability PREFIX "")
add_dependencies(reliability_programs AllocationShim)

# Random edits against an oracle.
zulm_add_reliability_program(random_edits random_edits.cpp)
target_link_libraries(random_edits PRIVATE ZULMetaData::Session)

# Threads, with the library under the thread sanitizer.
zulm_add_sanitized_copy(threads_stream_core ZULMetaData thread)
zulm_add_sanitized_copy(threads_bridge ZULMetaDataBridge thread)
target_link_libraries(threads_bridge PUBLIC threads_stream_core PRIVATE PNG::PNG TIFF::TIFF)
add_executable(threads EXCLUDE_FROM_ALL Reliability/Programs/threads.cpp)
target_link_libraries(threads PRIVATE threads_bridge)
zulm_project_options(threads)
set_target_properties(threads PROPERTIES RUNTIME_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/Reliability)
add_dependencies(reliability_programs threads)
