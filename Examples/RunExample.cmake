# Runs PROGRAM, under the EMULATOR where there is one, in a FOLDER that holds a movie of nothing but a file type, and
# compares what it prints with EXPECTED. BEFORE, where there is one, runs ahead of it. Both get the ARGUMENT.
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
