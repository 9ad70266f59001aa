zulm_add_tests(ZULMetaDataSessionTests
  Insights/ClicksTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session)
