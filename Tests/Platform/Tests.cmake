find_package(TIFF REQUIRED)

# Some of these run other programs, which are ImageMagick's convert and pngcheck.
zulm_add_tests(PlatformTests
  AssertionReportTest
  CoarseClockTest
  DurableFileTest
  EncodedImageCheckTest
  EncodedImageInfoTest
  FileLocationTest
  FileSystemTest
  ImageTest
  LockFileTest
  NewFileTest
  PNGDecodeTest
  ProcessInfoTest
  TIFFDecodeTest)
target_sources(PlatformTests PRIVATE Platform/ImageTestSupport.cpp)
target_link_libraries(PlatformTests PRIVATE TIFF::TIFF)

# These limit the memory that is to be had.
zulm_add_tests(PlatformMemoryTests
  ImageMemoryTest)
target_link_libraries(PlatformMemoryTests PRIVATE ZULMetaDataMemoryWatch)

# What takes the place of the codecs in a build without them.
zulm_add_tests(PlatformWithoutCodecsTests
  ImageWithoutCodecsTest)
target_sources(PlatformWithoutCodecsTests PRIVATE
  Platform/ImageTestSupport.cpp
  ${PROJECT_SOURCE_DIR}/Platform/ImageWithoutCodecs.cpp)
