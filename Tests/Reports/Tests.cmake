zulm_add_tests(ReportsTests
  JsonWriterTest
  NumberTest
  TextTest)
target_link_libraries(ReportsTests PRIVATE zulm_reports ZULMetaDataToolTestSupport)
