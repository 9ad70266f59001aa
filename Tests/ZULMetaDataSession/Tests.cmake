zulm_add_tests(ZULMetaDataSessionTests
  EditListTest
  EditLists/AutoEditorTest
  EditLists/CMX3600Test
  EditLists/ConcatTest
  EditLists/EditListFilesTest
  EditLists/LosslessCutTest
  EditLists/MovieEditListTest
  EditLists/OpenTimelineTest
  PieceClockTest
  RationalTest
  RecordingTest
  RetimingTest
  TrackTest)
target_link_libraries(ZULMetaDataSessionTests PRIVATE ZULMetaData::Session ZULMetaDataInvalidCorpus)
