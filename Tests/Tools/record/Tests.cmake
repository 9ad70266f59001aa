# Runs the recorder on X servers without a screen.
find_program(PYTHON3 python3 REQUIRED)
mark_as_advanced(PYTHON3)
set(record_tests ${CMAKE_CURRENT_LIST_DIR})
if(ZULMETADATA_RECORDER)
  add_executable(ShownWindow ${record_tests}/ShownWindow.cpp)
  target_link_libraries(ShownWindow PRIVATE PkgConfig::ZULMETADATA_RECORDER_LIBRARIES)
  zulm_project_options(ShownWindow)
  set_target_properties(ShownWindow PROPERTIES RUNTIME_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR})
  set(record_programs ZULM_RECORD=$<TARGET_FILE:zulm-record> SHOWN_WINDOW=$<TARGET_FILE:ShownWindow> ZULM=${ZULM_PATH})

  zulm_add_tests(RecorderTests FragmentedMovieTest HeldInputTest InstantTest JournalTest ScrollAxisTest)
  target_link_libraries(RecorderTests PRIVATE zulm_fragmented_movie zulm_recorder_core)
else()
  set(record_programs "")
endif()
# Somebody who works with an editor and a terminal.
add_test(NAME Tools/record/Applications COMMAND ${PYTHON3} ${record_tests}/real_desktop.py)
set_tests_properties(Tools/record/Applications PROPERTIES ENVIRONMENT "${record_programs}" SKIP_RETURN_CODE 77
  TIMEOUT 600)
# Each suite of the script is a test. They are skipped where the recorder is not built or no X server can be started.
foreach(suite IN ITEMS Files Picture Sound Pointer Keys Windows Control Loss Privacy)
  add_test(NAME Tools/record/${suite} COMMAND ${PYTHON3} ${record_tests}/test_recorder.py ${suite})
  set_tests_properties(Tools/record/${suite} PROPERTIES ENVIRONMENT "${record_programs}" SKIP_RETURN_CODE 77
    TIMEOUT 600)
endforeach()
