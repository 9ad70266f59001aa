# What applications do with the installed headers, tried with the headers and the library of this build.
if(CMAKE_SYSTEM_NAME STREQUAL "Linux")
  find_path(XLIB_HEADERS X11/Xlib.h REQUIRED)
  mark_as_advanced(XLIB_HEADERS)

  # A header that includes every installed one, by a path on which no folder of an application lies.
  get_target_property(installed_headers ZULMetaData HEADER_SET)
  get_target_property(bridge_headers ZULMetaDataBridge HEADER_SET)
  get_target_property(session_headers ZULMetaDataSession HEADER_SET)
  list(APPEND installed_headers ${bridge_headers} ${session_headers})
  set(own_folders ${CMAKE_CURRENT_LIST_DIR}/own_folders)
  set(includes "")
  foreach(header IN LISTS installed_headers)
    cmake_path(RELATIVE_PATH header BASE_DIRECTORY ${PROJECT_SOURCE_DIR} OUTPUT_VARIABLE name)
    if(name MATCHES "^(Platform|SharedDependencies)/" AND NOT EXISTS ${own_folders}/${name})
      message(SEND_ERROR "${own_folders} needs a header ${name}, so that the tests notice who includes it")
    endif()
    string(APPEND includes "#include \"${header}\"\n")
  endforeach()
  set(generated ${CMAKE_CURRENT_BINARY_DIR}/Consumers)
  file(CONFIGURE OUTPUT ${generated}/installed_headers.h CONTENT "#pragma once\n@includes@" @ONLY)

  add_executable(crowded_application ${CMAKE_CURRENT_LIST_DIR}/crowded_application.cpp)
  target_include_directories(crowded_application BEFORE PRIVATE ${own_folders} PRIVATE ${generated} ${XLIB_HEADERS})
  target_link_libraries(crowded_application PRIVATE ZULMetaData::Session)
  zulm_project_options(crowded_application)
  add_test(NAME Consumers/crowded_application COMMAND crowded_application)
endif()

find_program(PYTHON3 python3 REQUIRED)
mark_as_advanced(PYTHON3)
set(compile_with ${CMAKE_CXX_COMPILER} -std=c++20 -I${PROJECT_SOURCE_DIR})
add_test(NAME Consumers/wrong_type COMMAND ${PYTHON3} ${CMAKE_CURRENT_LIST_DIR}/compile.py refused
  ${CMAKE_CURRENT_LIST_DIR}/wrong_type.cpp "T must be one of these" ${compile_with})

# zulm_add_header_cost(HEADER SHARE): see compile.py.
function(zulm_add_header_cost header share)
  add_test(NAME Consumers/cost/${header} COMMAND ${PYTHON3} ${CMAKE_CURRENT_FUNCTION_LIST_DIR}/compile.py cost
    ${header} ${share} ${compile_with})
endfunction()
zulm_add_header_cost(ZULMetaDataBridge/ZULMetaDataBridge.h 12)
zulm_add_header_cost(ZULMetaData/ZULMMetaDataWriter.h -20)
zulm_add_header_cost(ZULMetaDataBridge/ZULMetaDataForward.h -99)
