# Sees every block of memory that the library asks for: the linker sends those calls through it.
add_library(ZULMetaDataMemoryWatch ZULMetaData/MemoryWatch.cpp)
target_link_libraries(ZULMetaDataMemoryWatch PUBLIC ZULMetaDataTestSupport)
target_link_options(ZULMetaDataMemoryWatch INTERFACE LINKER:--wrap=malloc,--wrap=calloc,--wrap=free)
zulm_project_options(ZULMetaDataMemoryWatch)

foreach(path IN ITEMS ZULMetaData/CursorImageRecordTest ZULMetaData/CursorImageSchemaTest
                      ZULMetaData/ZULMMetaDataCommonTest ZULMetaData/ZULMMetaDataReaderTest)
  zulm_add_test(${path})
  string(REPLACE "/" "." name ${path})
  target_link_libraries(${name} PRIVATE ZULMetaDataMemoryWatch)
endforeach()
zulm_add_test(ZULMetaData/ValueTypesTest)
zulm_add_test(ZULMetaData/ZULMMetaDataUUIDsTest)
zulm_add_test(ZULMetaData/ZULMMetaDataWriterTest)
