zulm_add_tests(ZULMetaDataSessionTests
  RecordingClockTest
  SessionWriterTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session)
