# What the tests start as the tool: where it is made for another processor, a script that runs it under the emulator.
set(ZULM_PATH $<TARGET_FILE:zulm>)
if(CMAKE_CROSSCOMPILING_EMULATOR)
  set(ZULM_PATH ${CMAKE_CURRENT_BINARY_DIR}/Tools/emulated/zulm)
  file(GENERATE OUTPUT ${ZULM_PATH}
    CONTENT "#!/bin/sh\nexec ${CMAKE_CROSSCOMPILING_EMULATOR} $<TARGET_FILE:zulm> \"$@\"\n"
    FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE)
endif()

# What the tests of the tool share: running it, and a recording to run it on.
add_library(ZULMetaDataToolTestSupport Tools/Golden.cpp Tools/RecordedSession.cpp Tools/ToolRun.cpp)
target_link_libraries(ZULMetaDataToolTestSupport PUBLIC ZULMetaDataTestSupport zulm_demo)
target_compile_definitions(ZULMetaDataToolTestSupport PRIVATE
  ZULM_PATH="${ZULM_PATH}" ZULM_TEST_DATA="${CMAKE_CURRENT_SOURCE_DIR}/Data")
zulm_project_options(ZULMetaDataToolTestSupport)

# zulm_add_tool_test(PATH): as zulm_add_test, for a test that runs the tool. ZULM_PATH is what the tool is started by.
function(zulm_add_tool_test path)
  zulm_add_test(${path})
  string(REPLACE "/" "." name ${path})
  target_link_libraries(${name} PRIVATE ZULMetaDataToolTestSupport)
  target_compile_definitions(${name} PRIVATE ZULM_PATH="${ZULM_PATH}")
  add_dependencies(${name} zulm)
endfunction()

zulm_add_tool_test(Tools/AtomsCommandTest)
zulm_add_tool_test(Tools/CommandLineTest)
zulm_add_tool_test(Tools/DemoCommandTest)
zulm_add_tool_test(Tools/DumpCommandTest)
zulm_add_tool_test(Tools/InfoCommandTest)
zulm_add_tool_test(Tools/ManualTest)
target_compile_definitions(Tools.ManualTest PRIVATE ZULM_DOCS="${PROJECT_SOURCE_DIR}/Docs")
zulm_add_test(Tools/NumberTest)
target_link_libraries(Tools.NumberTest PRIVATE zulm_reports)
zulm_add_test(Tools/OutOfMemoryTest)
target_link_libraries(Tools.OutOfMemoryTest PRIVATE zulm_commands)
zulm_add_tool_test(Tools/OutputFileTest)
target_link_libraries(Tools.OutputFileTest PRIVATE zulm_commands)
zulm_add_tool_test(Tools/SchemaTest)
target_compile_definitions(Tools.SchemaTest PRIVATE
  ZULM_DOCS="${PROJECT_SOURCE_DIR}/Docs" ZULM_TEST_DATA="${CMAKE_CURRENT_SOURCE_DIR}/Data")
zulm_add_tool_test(Tools/ToolRunTest)
zulm_add_tool_test(Tools/ViewCommandTest)
target_compile_definitions(Tools.ViewCommandTest PRIVATE ZULM_HAS_PAGE=$<BOOL:${ZULM_VIEWER}>)
include(Tools/VerifyTests.cmake)
