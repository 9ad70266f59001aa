zulm_add_tests(SharedDependenciesTests
  CallbackTest
  CreatorAttributesTest
  EndianFileTest
  ZCAPHeaderTest)
