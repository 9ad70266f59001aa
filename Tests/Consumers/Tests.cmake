# Projects of other people, built and run against what is installed: static libraries and the tool in one place, shared
# libraries in another.
option(ZULMETADATA_TEST_CONSUMERS "Test what is installed, with clang, make and pkg-config beside" OFF)
if(NOT ZULMETADATA_TEST_CONSUMERS)
  return()
endif()
find_program(CLANGXX clang++ REQUIRED)
find_program(MAKE make REQUIRED)
find_program(PKG_CONFIG pkg-config REQUIRED)
find_program(PYTHON3 python3 REQUIRED)
mark_as_advanced(CLANGXX MAKE PKG_CONFIG PYTHON3)

set(sources ${CMAKE_CURRENT_LIST_DIR})
set(folder ${PROJECT_BINARY_DIR}/consumers)
set(static ${folder}/static)
set(shared ${folder}/shared)

get_target_property(unity ZULMetaData UNITY_BUILD) # what builds the library once more does it as this build does

add_test(NAME Consumers/install_static COMMAND
  ${CMAKE_COMMAND} -DBUILD=${PROJECT_BINARY_DIR} -DPREFIX=${static} -P ${sources}/InstallStatic.cmake)
add_test(NAME Consumers/install_shared COMMAND
  ${CMAKE_COMMAND} -DSOURCE=${PROJECT_SOURCE_DIR} -DBUILD=${folder}/shared-build -DPREFIX=${shared}
  -DGENERATOR=${CMAKE_GENERATOR} -DCOMPILER=${CMAKE_CXX_COMPILER} -DLAUNCHER=${CMAKE_CXX_COMPILER_LAUNCHER}
  -DUNITY=${unity} -P ${sources}/InstallShared.cmake)
set_tests_properties(Consumers/install_static PROPERTIES FIXTURES_SETUP static_package)
set_tests_properties(Consumers/install_shared PROPERTIES FIXTURES_SETUP shared_package)

# zulm_add_cmake_consumer(NAME PROJECT PROGRAM OPTION...)
function(zulm_add_cmake_consumer name project program)
  add_test(NAME Consumers/${name} COMMAND ${CMAKE_CTEST_COMMAND} --build-and-test
    ${sources}/${project} ${folder}/${name} --build-generator ${CMAKE_GENERATOR}
    --build-options ${ARGN} -DCMAKE_CXX_COMPILER_LAUNCHER=${CMAKE_CXX_COMPILER_LAUNCHER} -DCMAKE_BUILD_TYPE=Debug
    -DCMAKE_UNITY_BUILD=${unity} -DCMAKE_EXPORT_NO_PACKAGE_REGISTRY=ON --test-command ${program})
endfunction()
zulm_add_cmake_consumer(find_package find_package application
  -DCMAKE_PREFIX_PATH=${shared} -DCMAKE_CXX_COMPILER=${CMAKE_CXX_COMPILER} -DEXPECT_TOOLS=FALSE -DEXPECT_VIEWER=FALSE)
set(tools FALSE)
if(ZULMETADATA_BUILD_TOOLS)
  set(tools TRUE)
endif()
zulm_add_cmake_consumer(find_package_clang_static find_package application
  -DCMAKE_PREFIX_PATH=${static} -DCMAKE_CXX_COMPILER=${CLANGXX} -DCMAKE_CXX_STANDARD=23
  -DEXPECT_TOOLS=${tools} -DEXPECT_VIEWER=$<BOOL:${ZULM_VIEWER}>)
zulm_add_cmake_consumer(core_without_codecs core_without_codecs player
  -DCMAKE_PREFIX_PATH=${static} -DCMAKE_CXX_COMPILER=${CMAKE_CXX_COMPILER})
zulm_add_cmake_consumer(add_subdirectory add_subdirectory player
  -DZULMETADATA_SOURCE=${PROJECT_SOURCE_DIR} -DCMAKE_CXX_COMPILER=${CMAKE_CXX_COMPILER})
zulm_add_cmake_consumer(fetch_content fetch_content application
  -DZULMETADATA_SOURCE=${PROJECT_SOURCE_DIR} -DCMAKE_CXX_COMPILER=${CMAKE_CXX_COMPILER})
zulm_add_cmake_consumer(examples ../../Examples "${CMAKE_CTEST_COMMAND};--no-tests=error"
  -DCMAKE_PREFIX_PATH=${shared} -DCMAKE_CXX_COMPILER=${CMAKE_CXX_COMPILER})

# zulm_add_make_consumer(NAME PREFIX PKG_CONFIG_OPTION)
function(zulm_add_make_consumer name prefix flags)
  file(MAKE_DIRECTORY ${folder}/${name})
  add_test(NAME Consumers/${name} COMMAND ${CMAKE_COMMAND} -E env PKG_CONFIG_PATH=${prefix}/${CMAKE_INSTALL_LIBDIR}/pkgconfig
    ${MAKE} --always-make -f ${sources}/pkg_config/Makefile CXX=${CMAKE_CXX_COMPILER} VERSION=${PROJECT_VERSION}
    PKG_CONFIG_FLAGS=${flags} WORKING_DIRECTORY ${folder}/${name})
endfunction()
include(GNUInstallDirs)
zulm_add_make_consumer(pkg_config ${shared} "")
zulm_add_make_consumer(pkg_config_static ${static} --static)

set(libraries ${shared}/${CMAKE_INSTALL_LIBDIR})
add_test(NAME Consumers/bridge_finds_core COMMAND
  ${PYTHON3} -c "import ctypes, sys; ctypes.CDLL(sys.argv[1])" ${libraries}/libZULMetaDataBridge.so)
add_test(NAME Consumers/symbols_of_core COMMAND ${CMAKE_COMMAND}
  -DLIBRARY=${libraries}/libZULMetaData.so -DABI_VERSION=${ZULMETADATA_ABI_VERSION}
  "-DSHOWN=MetaDataParser::create;CursorImageSchema::GetDataSteps;fileOpen" "-DHIDDEN=detail::scanAtoms"
  -P ${sources}/CheckSymbols.cmake)
add_test(NAME Consumers/symbols_of_bridge COMMAND ${CMAKE_COMMAND}
  -DLIBRARY=${libraries}/libZULMetaDataBridge.so -DABI_VERSION=${ZULMETADATA_ABI_VERSION}
  "-DSHOWN=SafeMovieSave::attach;Image::tiffRepresentation;SaveError"
  "-DHIDDEN=decodePNG;MovieFile" -P ${sources}/CheckSymbols.cmake)

add_test(NAME Consumers/symbols_of_session COMMAND ${CMAKE_COMMAND}
  -DLIBRARY=${libraries}/libZULMetaDataSession.so -DABI_VERSION=${ZULMETADATA_ABI_VERSION}
  "-DSHOWN=Recording::streams;Error;Rational::parse" "-DHIDDEN=JsonReader" -P ${sources}/CheckSymbols.cmake)

set_tests_properties(Consumers/find_package Consumers/examples Consumers/pkg_config Consumers/bridge_finds_core
  Consumers/symbols_of_core Consumers/symbols_of_bridge Consumers/symbols_of_session PROPERTIES FIXTURES_REQUIRED shared_package)
set_tests_properties(Consumers/find_package_clang_static Consumers/core_without_codecs Consumers/pkg_config_static
  PROPERTIES FIXTURES_REQUIRED static_package)
set_property(TEST Consumers/install_static Consumers/install_shared Consumers/find_package
  Consumers/find_package_clang_static Consumers/core_without_codecs Consumers/add_subdirectory Consumers/fetch_content
  Consumers/bridge_finds_core Consumers/examples Consumers/pkg_config Consumers/pkg_config_static
  Consumers/symbols_of_core Consumers/symbols_of_bridge Consumers/symbols_of_session PROPERTY LABELS consumers)
