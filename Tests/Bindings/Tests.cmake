zulm_add_tests(BindingsTests
  BlockCacheTest
  CInterfaceTest)
target_link_libraries(BindingsTests PRIVATE zulmetadata_c ZULMetaDataToolTestSupport ZULMetaDataInvalidCorpus)
add_dependencies(BindingsTests zulm)
add_test(NAME Bindings/HeaderIsC
  COMMAND ${CMAKE_CXX_COMPILER} -x c -std=c99 -pedantic -Wall -Wextra -Werror -fsyntax-only
    ${PROJECT_SOURCE_DIR}/Bindings/JavaScript/zulmetadata_c.h)

# What the C++ library computes, which the bindings must compute too.
add_executable(session_numbers ${CMAKE_CURRENT_LIST_DIR}/session_numbers.cpp)
target_link_libraries(session_numbers PRIVATE zulm_tables zulm_reports)
zulm_project_options(session_numbers)
set(session_numbers ZULM_PATH=${ZULM_PATH} ZULM_SESSION_NUMBERS=$<TARGET_FILE:session_numbers>)

# The module for JavaScript, where it is built.
if(ZULM_VIEWER)
  foreach(test IN ITEMS hostile package recording session slices)
    add_test(NAME JavaScript/${test}
      COMMAND ${CMAKE_COMMAND} -E env ${session_numbers} ZULM_PACKAGE=${ZULMETADATA_PACKAGE}
        ZULM_TEST_DATA=${CMAKE_CURRENT_SOURCE_DIR}/Data
        ${NODE} --test ${CMAKE_CURRENT_SOURCE_DIR}/Bindings/JavaScript/${test}.test.mjs)
    set_tests_properties(JavaScript/${test} PROPERTIES TIMEOUT 300)
  endforeach()
endif()

# The package for Python, where it is built.
if(ZULMETADATA_PYTHON)
  add_test(NAME Bindings/Python
    COMMAND ${CMAKE_COMMAND} -E env PYTHONPATH=${ZULMETADATA_PYTHON_PACKAGE} PYTHONDONTWRITEBYTECODE=1 ${session_numbers}
      ${Python_EXECUTABLE} -m pytest -q -p no:cacheprovider ${CMAKE_CURRENT_SOURCE_DIR}/Bindings/Python)
  set_tests_properties(Bindings/Python PROPERTIES TIMEOUT 900) # it starts a cluster of two workers
endif()
if(ZULMETADATA_PYTHON AND ZULMETADATA_TEST_CONSUMERS)
  add_test(NAME Consumers/wheel COMMAND ${CMAKE_COMMAND} -DPYTHON=${Python_EXECUTABLE}
    -DSOURCE=${PROJECT_SOURCE_DIR}/Bindings/Python -DFOLDER=${PROJECT_BINARY_DIR}/consumers/wheel
    -DLAUNCHER=${CMAKE_CXX_COMPILER_LAUNCHER} -DGENERATOR=${CMAKE_GENERATOR} -DVERSION=${PROJECT_VERSION}
    -P ${CMAKE_CURRENT_SOURCE_DIR}/Bindings/Python/Wheel.cmake)
  set_tests_properties(Consumers/wheel PROPERTIES LABELS consumers)
endif()
