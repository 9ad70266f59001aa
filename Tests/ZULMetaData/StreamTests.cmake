foreach(path IN ITEMS ZULMetaData/CursorImageRecordTest ZULMetaData/CursorImageSchemaTest
                      ZULMetaData/ZULMMetaDataCommonTest ZULMetaData/ZULMMetaDataReaderTest)
  zulm_add_test(${path})
  string(REPLACE "/" "." name ${path})
  target_link_libraries(${name} PRIVATE ZULMetaDataMemoryWatch)
endforeach()
zulm_add_test(ZULMetaData/ValueTypesTest)
zulm_add_test(ZULMetaData/ZULMMetaDataUUIDsTest)
zulm_add_test(ZULMetaData/ZULMMetaDataWriterTest)
