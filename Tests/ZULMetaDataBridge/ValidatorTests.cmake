# The invalid recordings, for the tests of the validator and of the tool.
add_library(ZULMetaDataInvalidCorpus Support/InvalidCorpus.cpp)
target_link_libraries(ZULMetaDataInvalidCorpus PUBLIC ZULMetaDataTestSupport)
target_compile_definitions(ZULMetaDataInvalidCorpus
                           PRIVATE ZULM_INVALID_CORPUS="${CMAKE_CURRENT_SOURCE_DIR}/Data/invalid")
zulm_project_options(ZULMetaDataInvalidCorpus)

foreach(path IN ITEMS ZULMetaDataBridge/InvalidCorpusTest ZULMetaDataBridge/MetaDataValidatorTest)
  zulm_add_test(${path})
  string(REPLACE "/" "." name ${path})
  target_link_libraries(${name} PRIVATE ZULMetaDataInvalidCorpus)
endforeach()
target_link_libraries(ZULMetaDataBridge.MetaDataValidatorTest PRIVATE ZULMetaDataMemoryWatch)

zulm_add_test(Platform/EncodedImageInfoTest)
