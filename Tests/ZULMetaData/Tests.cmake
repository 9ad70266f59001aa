zulm_add_tests(ZULMetaDataTests
  AtomRepairTest
  ContainerLayoutTest
  ContainerRecognitionTest
  ContainerScanTest
  FileInputBufferTest
  MP4MetaDataTest
  MetaDataParserTest
  MovieDurationTest
  ParserUtilTest
  RecordingInfoTest
  RepairPlanTest
  SmallAtomsTest
  StreamEntriesTest
  StreamExtentTest
  ValueTypesTest
  WideRIFFTest
  ZULMMetaDataUUIDsTest
  ZULMMetaDataWriterTest)

# These count the memory that the library asks for.
zulm_add_tests(ZULMetaDataMemoryTests
  CursorImageRecordTest
  CursorImageSchemaTest
  ZULMMetaDataCommonTest
  ZULMMetaDataReaderTest)
target_link_libraries(ZULMetaDataMemoryTests PRIVATE ZULMetaDataMemoryWatch)
