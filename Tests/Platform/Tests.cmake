find_package(TIFF REQUIRED)

# Some of these run other programs, which are ImageMagick's convert and pngcheck.
zulm_add_tests(PlatformTests
  AssertionReportTest
  DurableFileTest
  EncodedImageCheckTest
  EncodedImageInfoTest
  FileLocationTest
  FileSystemTest
  ImageTest
  PNGDecodeTest
  ProcessInfoTest
  TIFFDecodeTest)
target_sources(PlatformTests PRIVATE Platform/ImageTestSupport.cpp)
target_link_libraries(PlatformTests PRIVATE TIFF::TIFF)

# What takes the place of the codecs in a build without them.
zulm_add_tests(PlatformStructureTests
  ImageStructureTest)
target_sources(PlatformStructureTests PRIVATE
  Platform/ImageTestSupport.cpp
  ${PROJECT_SOURCE_DIR}/Platform/PNGStructure.cpp
  ${PROJECT_SOURCE_DIR}/Platform/TIFFStructure.cpp)
target_link_libraries(PlatformStructureTests PRIVATE TIFF::TIFF)
