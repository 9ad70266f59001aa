# Sets ZULMETADATA_RENDERER if the renderer can be built, and makes the target ZULMETADATA_RENDERER_LIBRARIES of what it
# needs.
set(ZULMETADATA_RENDERER OFF)
if(NOT ZULMETADATA_BUILD_RENDERER OR NOT ZULMETADATA_BUILD_TOOLS OR NOT CMAKE_SYSTEM_NAME STREQUAL "Linux"
   OR EMSCRIPTEN OR CMAKE_CROSSCOMPILING)
  return()
endif()
if(ZULMETADATA_BUILD_RENDERER STREQUAL "AUTO")
  set(wanted QUIET)
else()
  set(wanted REQUIRED)
endif()
find_package(PkgConfig ${wanted})
if(PkgConfig_FOUND)
  pkg_check_modules(ZULMETADATA_RENDERER_LIBRARIES ${wanted} IMPORTED_TARGET
    libavcodec>=59.37 libavfilter>=8.44 libavformat>=59.27 libavutil>=57.28 libswresample>=4.7 libswscale>=6.7 cairo pangocairo)
  set(ZULMETADATA_RENDERER ${ZULMETADATA_RENDERER_LIBRARIES_FOUND})
endif()
