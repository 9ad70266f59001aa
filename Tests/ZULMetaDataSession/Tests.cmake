zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  Insights/ChaptersTest
  Insights/ClicksTest
  Insights/IdleTest
  Insights/KeyCaptionsTest
  RationalTest
  RecordingClockTest
  RecordingTest
  SessionWriterTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
