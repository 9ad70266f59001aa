zulm_add_tests(ZULMetaDataBridgeTests
  ApplicationValuesTest
  CrashedRecordingTest
  CursorImageMetaDataTest
  EntryDictionaryTest
  EntryTextsTest
  HumanReadableActionsTest
  InputVocabularyTest
  Validation/InvalidCorpusTest
  KeyNamesTest
  KindsTest
  MediaFilesTest
  MetaDataExcerptTest
  ParserFamilyTest
  RecordingCompactionTest
  RecordingFileTest
  RecordingRedactionTest
  SafeMovieSaveTest
  StoredFieldsTest
  StreamRedactionTest
  StreamRetimingTest
  StreamSalvageTest
  SystemDataMetaDataTest
  WriterFamilyTest
  WriterHealthTest
  ZULMAtomRepairTest
  ZULMAtomWriterTest
  ZULRAtomWriterTest)
target_link_libraries(ZULMetaDataBridgeTests PRIVATE ZULMetaDataInvalidCorpus)

# These count the memory that the library asks for.
zulm_add_tests(ZULMetaDataBridgeMemoryTests
  Validation/MetaDataValidatorTest)
target_link_libraries(ZULMetaDataBridgeMemoryTests PRIVATE ZULMetaDataInvalidCorpus ZULMetaDataMemoryWatch)
