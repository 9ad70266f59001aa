# The viewer's page: its own tests, and tests of it in a browser.
find_program(CHROMIUM NAMES chromium chromium-browser)
if(ZULM_VIEWER)
  add_test(NAME viewer/page COMMAND ${NPM} test --silent
    WORKING_DIRECTORY ${PROJECT_BINARY_DIR}/Tools/viewer/build/Tools/viewer/page)
  set_tests_properties(viewer/page PROPERTIES TIMEOUT 300)
endif()

if(ZULM_VIEWER AND CHROMIUM)
  add_executable(long_recording Tools/viewer/LongRecording.cpp)
  target_link_libraries(long_recording PRIVATE zulm_demo ZULMetaData::Bridge)
  zulm_project_options(long_recording)

  set(viewer_tests ${CMAKE_CURRENT_SOURCE_DIR}/Tools/viewer)
  set(viewer_packages ${CMAKE_CURRENT_BINARY_DIR}/Tools/viewer)
  add_custom_command(
    OUTPUT ${viewer_packages}/installed
    COMMAND ${CMAKE_COMMAND} -E make_directory ${viewer_packages}
    COMMAND ${CMAKE_COMMAND} -E copy package.json package-lock.json .npmrc ${viewer_packages}
    COMMAND ${CMAKE_COMMAND} -E chdir ${viewer_packages} ${NPM} ci --no-progress --loglevel=error
    COMMAND ${CMAKE_COMMAND} -E touch ${viewer_packages}/installed
    WORKING_DIRECTORY ${viewer_tests}
    DEPENDS ${viewer_tests}/package.json ${viewer_tests}/package-lock.json ${viewer_tests}/.npmrc
    COMMENT "Installing what the page is tested with"
    VERBATIM)
  add_custom_target(viewer_test_packages ALL DEPENDS ${viewer_packages}/installed)
  set(viewer_settings ZULM_PATH=${ZULM_PATH} ZULM_TEST_DATA=${CMAKE_CURRENT_SOURCE_DIR}/Data CHROMIUM=${CHROMIUM}
    ZULM_TEST_MODULES=${viewer_packages} ZULM_LONG_RECORDING=$<TARGET_FILE:long_recording>)
  foreach(test IN ITEMS access belonging frames hostile lanes long notes range session speed table timeline touch transport)
    add_test(NAME viewer/${test}
      COMMAND ${CMAKE_COMMAND} -E env ${viewer_settings} ${NODE} --test ${viewer_tests}/${test}.test.mjs)
    set_tests_properties(viewer/${test} PROPERTIES TIMEOUT 600)
  endforeach()
  set_tests_properties(viewer/frames viewer/long viewer/speed PROPERTIES RUN_SERIAL TRUE)

  # The pictures of the documentation.
  set(recorder_setting "")
  if(ZULMETADATA_RECORDER)
    set(recorder_setting ZULM_RECORD=$<TARGET_FILE:zulm-record>)
  endif()
  add_custom_target(viewer_screenshots
    COMMAND ${CMAKE_COMMAND} -E env ${viewer_settings} ${recorder_setting} ${NODE} ${viewer_tests}/screenshots.mjs
      ${PROJECT_SOURCE_DIR}/Docs/viewer
    DEPENDS viewer_test_packages zulm
    VERBATIM)

  # Pictures of the whole page at every size, to be looked at.
  add_custom_target(viewer_every_size
    COMMAND ${CMAKE_COMMAND} -E env ${viewer_settings} ${NODE} ${viewer_tests}/screenshots.mjs --every
      ${viewer_packages}/every-size
    DEPENDS viewer_test_packages zulm
    VERBATIM)

  # The table of figures of the documentation.
  add_custom_target(viewer_figures
    COMMAND ${CMAKE_COMMAND} -E env ${viewer_settings} ${NODE} ${viewer_tests}/figures.mjs
    DEPENDS viewer_test_packages zulm
    VERBATIM)
endif()
