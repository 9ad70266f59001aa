zulm_add_tests(ReportsTests
  EntryFormatTest
  FindingsTest
  InfoReportTest
  JsonWriterTest
  LayoutTest
  NumberTest
  TextTest)
target_link_libraries(ReportsTests PRIVATE zulm_reports ZULMetaDataToolTestSupport)
