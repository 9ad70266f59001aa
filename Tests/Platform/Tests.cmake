find_package(TIFF REQUIRED)

zulm_add_test(Platform/AssertionReportTest)
zulm_add_test(Platform/FileLocationTest)
zulm_add_test(Platform/FileSystemTest)

# These run other programs: those of images ImageMagick's convert and pngcheck.
foreach(test IN ITEMS ImageStructureTest ImageTest PNGDecodeTest ProcessInfoTest TIFFDecodeTest)
  zulm_add_test(Platform/${test})
  target_sources(Platform.${test} PRIVATE Platform/ImageTestSupport.cpp)
  target_link_libraries(Platform.${test} PRIVATE TIFF::TIFF)
endforeach()
target_sources(Platform.ImageStructureTest PRIVATE
  ${PROJECT_SOURCE_DIR}/Platform/PNGStructure.cpp
  ${PROJECT_SOURCE_DIR}/Platform/TIFFStructure.cpp)
