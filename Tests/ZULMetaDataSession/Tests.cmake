zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  RationalTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session)
