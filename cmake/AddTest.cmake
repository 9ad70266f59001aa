include(GoogleTest)

# zulm_add_test(PATH): one test program from PATH.cpp, named after its path below Tests/. Every test in it becomes a
# test of CTest. Where a test runs other programs, its file says which.
function(zulm_add_test path)
  string(REPLACE "/" "." name ${path})
  add_executable(${name} ${path}.cpp)
  target_link_libraries(${name} PRIVATE ZULMetaDataTestSupport)
  zulm_project_options(${name})
  target_precompile_headers(${name} REUSE_FROM ZULMetaDataTestSupport)
  # Without these, ccache keeps nothing that was compiled with a precompiled header.
  target_compile_options(${name} PRIVATE
    $<$<CXX_COMPILER_ID:GNU>:-fpch-preprocess> "$<$<CXX_COMPILER_ID:Clang>:SHELL:-Xclang -fno-pch-timestamp>")
  gtest_discover_tests(${name} TEST_PREFIX "${name}/" DISCOVERY_MODE PRE_TEST PROPERTIES TIMEOUT 300)
endfunction()
