# Sets ZULMETADATA_RECORDER where the recorder for X11 is built, and makes the target zulm_recorder_libraries of what it
# needs.
set(ZULMETADATA_RECORDER OFF)
if(NOT ZULMETADATA_BUILD_RECORDER OR NOT ZULMETADATA_BUILD_TOOLS OR NOT CMAKE_SYSTEM_NAME STREQUAL "Linux"
   OR EMSCRIPTEN OR CMAKE_CROSSCOMPILING)
  return()
endif()
if(ZULMETADATA_BUILD_RECORDER STREQUAL "AUTO")
  set(wanted QUIET)
else()
  set(wanted REQUIRED)
endif()
find_package(PkgConfig ${wanted})
if(PkgConfig_FOUND)
  pkg_check_modules(ZULMETADATA_RECORDER_LIBRARIES ${wanted} IMPORTED_TARGET
    x11 xtst xcb xcb-shm xcb-xfixes xcb-xinput xcb-randr xcb-composite xcb-xkb xkbcommon xkbcommon-x11
    libavcodec>=59 libavformat>=59 libavutil libswscale libpulse atspi-2 gobject-2.0 glib-2.0)
  set(ZULMETADATA_RECORDER ${ZULMETADATA_RECORDER_LIBRARIES_FOUND})
endif()
if(ZULMETADATA_RECORDER)
  find_package(fmt REQUIRED) # for the recorder, its tests and its fuzz target
endif()
