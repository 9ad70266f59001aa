# zulm_add_tests(PROGRAM FILE...): a test program made of FILE.cpp beside the caller. What else it needs is added to that
# target. Each test in it becomes a test of CTest called ROOM/FILE/SUITE.TEST. If an emulator runs the programs, each file
# becomes one test of CTest, because an emulator is slow to start.
function(zulm_add_tests program)
  list(TRANSFORM ARGN REPLACE "(.+)" "${CMAKE_CURRENT_LIST_DIR}/\\1.cpp" OUTPUT_VARIABLE files)
  add_executable(${program} ${files})
  target_link_libraries(${program} PRIVATE ZULMetaDataTestSupport)
  zulm_project_options(${program})
  zulm_reuse_precompiled_headers(${program} ZULMetaDataTestSupport)

  set(discovery ${CMAKE_CURRENT_BINARY_DIR}/${program}.discovery.cmake)
  file(GENERATE OUTPUT ${discovery} CONTENT
    "set(NAME ${program})
set(PROGRAM [==[$<TARGET_FILE:${program}>]==])
set(EMULATOR ${CMAKE_CROSSCOMPILING_EMULATOR})
set(TESTS [==[${CMAKE_CURRENT_BINARY_DIR}/${program}.tests.cmake]==])
include([==[${PROJECT_SOURCE_DIR}/cmake/DiscoverTests.cmake]==])
")
  set_property(DIRECTORY APPEND PROPERTY TEST_INCLUDE_FILES ${discovery})
endfunction()
