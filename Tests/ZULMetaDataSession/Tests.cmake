zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  RationalTest
  RecordingTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
