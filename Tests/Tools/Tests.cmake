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

# Some of these run ffmpeg and ffprobe.
find_package(nlohmann_json REQUIRED)
zulm_add_tests(ToolsTests
  AtomsCommandTest
  AttachCommandTest
  CommandLineTest
  CompactCommandTest
  ConvertCommandTest
  DemoCommandTest
  DiffCommandTest
  DumpCommandTest
  ExportCommandTest
  ExtractCommandTest
  GrepCommandTest
  InfoCommandTest
  InsightsCommandTest
  JsonReportTest
  ManualTest
  ManyFilesTest
  OutOfMemoryTest
  OutputFileTest
  RedactCommandTest
  RepairCommandTest
  SalvageCommandTest
  SchemaTest
  StampCommandTest
  StateCommandTest
  ToolRunTest
  VerifyCommandTest
  ViewCommandTest)
target_link_libraries(ToolsTests PRIVATE
  ZULMetaDataToolTestSupport ZULMetaDataInvalidCorpus zulm_commands nlohmann_json::nlohmann_json)
target_compile_definitions(ToolsTests PRIVATE
  ZULM_PATH="${ZULM_PATH}"
  ZULM_DUCKDB="$<$<BOOL:${ZULM_BUILD_PARQUET}>:${PROJECT_BINARY_DIR}/Tools/parquet/node_modules>"
  ZULM_DOCS="${PROJECT_SOURCE_DIR}/Docs"
  ZULM_TEST_DATA="${CMAKE_CURRENT_SOURCE_DIR}/Data"
  ZULM_HAS_PAGE=$<BOOL:${ZULM_VIEWER}>)
add_dependencies(ToolsTests zulm)
if(TARGET zulm_parquet)
  add_dependencies(ToolsTests zulm_parquet)
endif()
include(${CMAKE_CURRENT_LIST_DIR}/record/Tests.cmake)
