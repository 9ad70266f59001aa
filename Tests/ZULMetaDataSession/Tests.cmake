zulm_add_tests(ZULMetaDataSessionTests
  RationalTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session)
