zulm_add_tests(ZULMetaDataTests
  ByteSourceTest
  Containers/AtomRepairTest
  Containers/ContainerLayoutTest
  Containers/ContainerRecognitionTest
  Containers/ContainerScanTest
  FileInputBufferTest
  Containers/MP4MetaDataTest
  MetaDataParserTest
  Containers/MovieDurationTest
  ParserUtilTest
  Containers/RecordingInfoTest
  Containers/RepairPlanTest
  PositionedInputTest
  StreamEntriesTest
  StreamExtentTest
  ValueTypesTest
  Containers/WideRIFFTest
  ZULMMetaDataUUIDsTest
  ZULMMetaDataWriterTest)

# These count the memory that the library asks for.
zulm_add_tests(ZULMetaDataMemoryTests
  CursorImageWriterTest
  CursorImageSchemaTest
  ZULMMetaDataCommonTest
  ZULMMetaDataReaderTest)
target_link_libraries(ZULMetaDataMemoryTests PRIVATE ZULMetaDataMemoryWatch)
