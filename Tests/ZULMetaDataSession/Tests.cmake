zulm_add_tests(ZULMetaDataSessionTests
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session)
