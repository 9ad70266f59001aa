include(GoogleTest)

# zulm_add_test(PATH): one test program from PATH.cpp, named after its path below Tests/. Every test in it becomes a
# test of CTest, but for programs that an emulator runs. Where a test runs other programs, its file says which.
function(zulm_add_test path)
  string(REPLACE "/" "." name ${path})
  add_executable(${name} ${path}.cpp)
  target_link_libraries(${name} PRIVATE ZULMetaDataTestSupport)
  zulm_project_options(${name})
  zulm_reuse_precompiled_headers(${name} ZULMetaDataTestSupport)
  if(CMAKE_CROSSCOMPILING_EMULATOR)
    # All at once: an emulator is slow to start. It does not know a limit on its programs' memory.
    add_test(NAME ${name} COMMAND ${name} --gtest_filter=-ScarceMemory.*)
    set_tests_properties(${name} PROPERTIES TIMEOUT 1200)
  else()
    gtest_discover_tests(${name} TEST_PREFIX "${name}/" DISCOVERY_MODE PRE_TEST PROPERTIES TIMEOUT 300)
  endif()
endfunction()
