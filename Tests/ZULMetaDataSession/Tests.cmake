zulm_add_tests(ZULMetaDataSessionTests
  Insights/CameraTest
  Insights/ChaptersTest
  Insights/ClicksTest
  Insights/CursorPathTest
  Insights/IdleTest
  Insights/InsightsTest
  Insights/KeyCaptionsTest
  Insights/ZoomsTest
  RecordingTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
