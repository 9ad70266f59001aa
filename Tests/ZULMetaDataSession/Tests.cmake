zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  PieceClockTest
  RationalTest
  RecordingTest
  RetimingTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
