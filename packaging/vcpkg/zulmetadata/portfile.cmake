# From a checkout: vcpkg install zulmetadata --overlay-ports=packaging/vcpkg
# vcpkg does not see that the sources have changed: remove the package, and install it with --no-binarycaching.
cmake_path(SET SOURCE_PATH NORMALIZE ${CMAKE_CURRENT_LIST_DIR}/../../..)

vcpkg_check_features(OUT_FEATURE_OPTIONS FEATURE_OPTIONS
  FEATURES
    bridge ZULMETADATA_BUILD_BRIDGE
    image-codecs ZULMETADATA_IMAGE_CODECS)

vcpkg_cmake_configure(
  SOURCE_PATH ${SOURCE_PATH}
  OPTIONS
    ${FEATURE_OPTIONS}
    -DZULMETADATA_BUILD_TESTS=OFF
    -DZULMETADATA_BUILD_TOOLS=OFF
    -DZULMETADATA_WARNINGS_AS_ERRORS=OFF
    -DZULMETADATA_INSTALL=ON
  MAYBE_UNUSED_VARIABLES
    ZULMETADATA_IMAGE_CODECS) # without the bridge
vcpkg_cmake_install()
vcpkg_cmake_config_fixup(PACKAGE_NAME ZULMetaData CONFIG_PATH lib/cmake/ZULMetaData)
vcpkg_fixup_pkgconfig()

file(REMOVE_RECURSE ${CURRENT_PACKAGES_DIR}/debug/include ${CURRENT_PACKAGES_DIR}/debug/share)
set(VCPKG_POLICY_SKIP_COPYRIGHT_CHECK enabled) # no licence has been chosen yet
file(INSTALL ${CMAKE_CURRENT_LIST_DIR}/usage DESTINATION ${CURRENT_PACKAGES_DIR}/share/${PORT})
