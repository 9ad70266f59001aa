zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  Insights/ChaptersTest
  Insights/ClicksTest
  Insights/IdleTest
  Insights/KeyCaptionsTest
  PictureTest
  RationalTest
  RecordingTest
  SnapshotTest
  TimeIndexTest
  TimelineTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
