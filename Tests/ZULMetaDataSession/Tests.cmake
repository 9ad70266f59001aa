zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  PictureTest
  RationalTest
  RecordingTest
  SnapshotTest
  TimeIndexTest
  TimelineTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
