# Runs the example, under the emulator where there is one, in an empty folder and looks at what it prints.
set(folder ${CMAKE_CURRENT_BINARY_DIR}/record_and_read.run)
file(REMOVE_RECURSE ${folder})
file(MAKE_DIRECTORY ${folder})
file(WRITE ${folder}/Recording.mp4 "")
execute_process(COMMAND ${EMULATOR} ${PROGRAM} WORKING_DIRECTORY ${folder}
  OUTPUT_VARIABLE output COMMAND_ERROR_IS_FATAL ANY)
if(NOT output STREQUAL "640 0\n652 0.0166667\n")
  message(FATAL_ERROR "The example printed:\n${output}")
endif()
