# Renders films of recordings whose pictures say where everything must be.
set(render_tests ${CMAKE_CURRENT_LIST_DIR})
set(render_programs "")
if(ZULMETADATA_RENDERER)
  set(render_programs ZULM_RENDER=$<TARGET_FILE:zulm-render>)

  zulm_add_tests(RendererTests JsonFieldsTest KeyCapsTest OptionsTest RedactionsTest SoundTrackTest StageTest StyleTest
    TimeMapTest)
  target_link_libraries(RendererTests PRIVATE zulm_render_parts)
  # The libraries that draw are compiled against with -pthread, the precompiled headers without.
  set_target_properties(RendererTests PROPERTIES DISABLE_PRECOMPILE_HEADERS ON)
endif()
# Each suite of the script is a test. They are skipped if the renderer is not built.
foreach(suite IN ITEMS Marker Sound Styles Captions Cursor Outputs Hostile Redaction Golden Guide)
  add_test(NAME Tools/render/${suite} COMMAND ${PYTHON3} ${render_tests}/test_render.py ${suite})
  set_tests_properties(Tools/render/${suite} PROPERTIES ENVIRONMENT "${render_programs}" SKIP_RETURN_CODE 77
    TIMEOUT 900)
endforeach()

# The page beside the renderer.
if(ZULM_VIEWER AND CHROMIUM AND ZULMETADATA_RENDERER)
  add_test(NAME Tools/render/page
    COMMAND ${CMAKE_COMMAND} -E env ${viewer_settings} ${render_programs} ${NODE} --test ${render_tests}/page.test.mjs)
  set_tests_properties(Tools/render/page PROPERTIES TIMEOUT 1200)
endif()
