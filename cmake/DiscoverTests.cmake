# CTest reads this file before it runs tests. It asks PROGRAM which tests it has, again each time that PROGRAM was built,
# and adds them as zulm_add_tests describes. TESTS is the file that remembers them.
if(NOT EXISTS ${PROGRAM})
  add_test(${NAME}_NOT_BUILT ${NAME}_NOT_BUILT) # fails
  return()
endif()
if(EXISTS ${TESTS} AND NOT ${PROGRAM} IS_NEWER_THAN ${TESTS} AND NOT ${CMAKE_CURRENT_LIST_FILE} IS_NEWER_THAN ${TESTS})
  include(${TESTS})
  return()
endif()

set(script "")

# zulm_remember_test(NAME FILTER TIMEOUT)
macro(zulm_remember_test name filter timeout)
  string(APPEND script
    "add_test([==[${name}]==] ${EMULATOR} [==[${PROGRAM}]==] [==[--gtest_filter=${filter}]==])\n"
    "set_tests_properties([==[${name}]==] PROPERTIES TIMEOUT ${timeout} SKIP_REGULAR_EXPRESSION [==[\\[  SKIPPED \\]]==])\n")
endmacro()

execute_process(COMMAND ${EMULATOR} ${PROGRAM} --gtest_list_tests --gtest_output=xml:${TESTS}.xml
  OUTPUT_QUIET COMMAND_ERROR_IS_FATAL ANY)
file(STRINGS ${TESTS}.xml lines REGEX "<test(suite|case) ")
set(files "")
foreach(line IN LISTS lines)
  if(line MATCHES "<testsuite name=\"([^\"]*)\"")
    set(suite ${CMAKE_MATCH_1})
  elseif(line MATCHES "<testcase name=\"([^\"]*)\".* file=\"([^\"]*/)?Tests/([^\"]*)\\.[a-z]+\"")
    set(test ${suite}.${CMAKE_MATCH_1})
    set(file ${CMAKE_MATCH_3})
    if(EMULATOR)
      list(APPEND files ${file})
      list(APPEND "tests of ${file}" ${test})
    else()
      zulm_remember_test(${file}/${test} ${test} 300)
    endif()
  else()
    message(FATAL_ERROR "${PROGRAM} lists a test in a form that is not expected: ${line}")
  endif()
endforeach()
list(REMOVE_DUPLICATES files)
foreach(file IN LISTS files)
  list(JOIN "tests of ${file}" ":" filter)
  zulm_remember_test(${file} "${filter}:-*Memory.*" 1200) # an emulator has memory of its own
endforeach()

file(WRITE ${TESTS} "${script}")
include(${TESTS})
