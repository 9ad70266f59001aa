zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  Insights/CameraTest
  Insights/ChaptersTest
  Insights/ClicksTest
  Insights/CursorPathTest
  Insights/IdleTest
  Insights/KeyCaptionsTest
  Insights/ZoomsTest
  PieceClockTest
  RationalTest
  RecordingTest
  RetimingTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
