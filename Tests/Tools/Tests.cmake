# What the tests of the tool share: running it, and a recording to run it on.
add_library(ZULMetaDataToolTestSupport Tools/RecordedSession.cpp Tools/ToolRun.cpp)
target_link_libraries(ZULMetaDataToolTestSupport PUBLIC ZULMetaDataTestSupport zulm_demo)
target_compile_definitions(ZULMetaDataToolTestSupport PRIVATE ZULM_PATH="$<TARGET_FILE:zulm>")
zulm_project_options(ZULMetaDataToolTestSupport)

# zulm_add_tool_test(PATH): as zulm_add_test, for a test that runs the tool. ZULM_PATH is the built tool.
function(zulm_add_tool_test path)
  zulm_add_test(${path})
  string(REPLACE "/" "." name ${path})
  target_link_libraries(${name} PRIVATE ZULMetaDataToolTestSupport)
  target_compile_definitions(${name} PRIVATE ZULM_PATH="$<TARGET_FILE:zulm>")
  add_dependencies(${name} zulm)
endfunction()

zulm_add_tool_test(Tools/ToolRunTest)
include(Tools/VerifyTests.cmake)
