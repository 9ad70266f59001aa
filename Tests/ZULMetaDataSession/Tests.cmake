zulm_add_tests(ZULMetaDataSessionTests
  Insights/ClicksTest
  Insights/KeyCaptionsTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session)
