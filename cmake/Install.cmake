# What `cmake --install` puts in place, in the components Core, Bridge, Session, Tools, Viewer, Recorder and Renderer. What
# only a program's build needs of the libraries is in the components CoreDevelopment, BridgeDevelopment and SessionDevelopment.
include(CMakePackageConfigHelpers)
include(GNUInstallDirs)

set(data_folder ${CMAKE_INSTALL_DATADIR}/zulmetadata)
set(package_folder ${CMAKE_INSTALL_LIBDIR}/cmake/ZULMetaData)
set(pkgconfig_folder ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
cmake_path(RELATIVE_PATH CMAKE_INSTALL_PREFIX BASE_DIRECTORY ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig
  OUTPUT_VARIABLE pkgconfig_prefix)
cmake_path(APPEND pkgconfig_libdir "\${prefix}" ${CMAKE_INSTALL_LIBDIR})
cmake_path(APPEND pkgconfig_includedir "\${prefix}" ${CMAKE_INSTALL_INCLUDEDIR})
if(BUILD_SHARED_LIBS)
  set(pkgconfig_flags "")
else()
  set(pkgconfig_flags " -DZULMETADATA_STATIC")
endif()

# zulm_install_library(TARGET NAME PKGCONFIG)
function(zulm_install_library target name pkgconfig)
  install(TARGETS ${target} EXPORT ZULMetaData${name}Targets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT ${name} NAMELINK_COMPONENT ${name}Development
    ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT ${name}Development
    FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT ${name}Development)
  install(EXPORT ZULMetaData${name}Targets NAMESPACE ZULMetaData:: DESTINATION ${package_folder}
    COMPONENT ${name}Development)
  configure_file(${PROJECT_SOURCE_DIR}/cmake/${pkgconfig}.pc.in ${PROJECT_BINARY_DIR}/${pkgconfig}.pc @ONLY)
  install(FILES ${PROJECT_BINARY_DIR}/${pkgconfig}.pc DESTINATION ${pkgconfig_folder} COMPONENT ${name}Development)
endfunction()

# zulm_find_libraries_from(TARGET FOLDER): what is installed into FOLDER finds the shared libraries wherever both are
# put. Below /usr the system does that.
function(zulm_find_libraries_from target folder)
  if(CMAKE_INSTALL_PREFIX STREQUAL "/usr")
    return()
  endif()
  cmake_path(RELATIVE_PATH CMAKE_INSTALL_FULL_LIBDIR BASE_DIRECTORY ${folder} OUTPUT_VARIABLE way)
  set(here $<IF:$<PLATFORM_ID:Darwin>,@loader_path,$ORIGIN>) # the folder of what looks for them
  set_target_properties(${target} PROPERTIES INSTALL_RPATH ${here}/${way})
endfunction()

zulm_install_library(ZULMetaData Core zulmetadata-core)
set(needs_codecs OFF) # by programs themselves
if(ZULMETADATA_BUILD_BRIDGE)
  set(bridge_libraries "")
  if(ZULMETADATA_IMAGE_CODECS AND NOT BUILD_SHARED_LIBS)
    set(bridge_libraries "libpng libtiff-4")
    set(needs_codecs ON)
  endif()
  zulm_install_library(ZULMetaDataBridge Bridge zulmetadata-bridge)
  zulm_find_libraries_from(ZULMetaDataBridge ${CMAKE_INSTALL_FULL_LIBDIR})
  zulm_install_library(ZULMetaDataSession Session zulmetadata-session)
  zulm_find_libraries_from(ZULMetaDataSession ${CMAKE_INSTALL_FULL_LIBDIR})
endif()
if(ZULMETADATA_BUILD_TOOLS)
  zulm_find_libraries_from(zulm ${CMAKE_INSTALL_FULL_BINDIR})
  install(EXPORT ZULMetaDataToolsTargets NAMESPACE ZULMetaData:: DESTINATION ${package_folder} COMPONENT Tools)
endif()
if(ZULMETADATA_RECORDER)
  zulm_find_libraries_from(zulm-record ${CMAKE_INSTALL_FULL_BINDIR})
endif()
if(ZULMETADATA_RENDERER)
  zulm_find_libraries_from(zulm-render ${CMAKE_INSTALL_FULL_BINDIR})
endif()
if(ZULMETADATA_BUILD_TOOLS AND ZULM_VIEWER)
  install(FILES ${PROJECT_BINARY_DIR}/Tools/viewer/viewer.html DESTINATION ${data_folder} COMPONENT Viewer)
  install(DIRECTORY ${ZULMETADATA_PACKAGE}/ DESTINATION ${data_folder}/javascript COMPONENT Viewer)
endif()

# The package itself, which programs ask for with find_package.
set(package_file ${PROJECT_BINARY_DIR}/ZULMetaDataConfig.cmake)
set(version_file ${PROJECT_BINARY_DIR}/ZULMetaDataConfigVersion.cmake)
configure_package_config_file(${PROJECT_SOURCE_DIR}/cmake/ZULMetaDataConfig.cmake.in ${package_file}
  INSTALL_DESTINATION ${package_folder} PATH_VARS data_folder)
write_basic_package_version_file(${version_file} COMPATIBILITY SameMinorVersion)
install(FILES ${package_file} ${version_file} DESTINATION ${package_folder} COMPONENT CoreDevelopment)

if(PROJECT_IS_TOP_LEVEL)
  include(cmake/Packages.cmake)
endif()
