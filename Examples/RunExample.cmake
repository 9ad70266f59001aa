# Runs PROGRAM, under EMULATOR if it is set, in a FOLDER with a movie that consists of a file type atom only. Compares what
# it prints with EXPECTED. If BEFORE is set, that program runs first. Both get the ARGUMENT.
file(REMOVE_RECURSE ${FOLDER})
file(MAKE_DIRECTORY ${FOLDER})
execute_process(COMMAND printf "\\0\\0\\0\\20ftypmp42\\0\\0\\0\\0" OUTPUT_FILE ${FOLDER}/Movie.mp4
  COMMAND_ERROR_IS_FATAL ANY)
if(BEFORE)
  execute_process(COMMAND ${EMULATOR} ${BEFORE} ${ARGUMENT} WORKING_DIRECTORY ${FOLDER}
    OUTPUT_QUIET COMMAND_ERROR_IS_FATAL ANY)
endif()
execute_process(COMMAND ${EMULATOR} ${PROGRAM} ${ARGUMENT} WORKING_DIRECTORY ${FOLDER}
  OUTPUT_VARIABLE printed ERROR_VARIABLE complaints RESULT_VARIABLE ended)
file(READ ${EXPECTED} expected)
if(NOT ended EQUAL 0 OR NOT printed STREQUAL expected OR complaints)
  message(FATAL_ERROR "It ended with ${ended} and printed:\n${printed}${complaints}\nnot:\n${expected}")
endif()
