# Builds a wheel of SOURCE with PYTHON in FOLDER, without a network, installs it there, and imports it. What was compiled
# stays for the next time.
file(REMOVE_RECURSE ${FOLDER}/wheel ${FOLDER}/installed)
file(MAKE_DIRECTORY ${FOLDER})
set(pip ${PYTHON} -m pip --quiet --disable-pip-version-check --no-cache-dir)
execute_process(COMMAND ${CMAKE_COMMAND} -E env ZULMETADATA_PYTHON_BUILD=${FOLDER}/build CMAKE_GENERATOR=${GENERATOR}
    CMAKE_CXX_COMPILER_LAUNCHER=${LAUNCHER}
    ${pip} wheel ${SOURCE} --no-build-isolation --no-index --no-deps --wheel-dir ${FOLDER}/wheel
  OUTPUT_QUIET COMMAND_ERROR_IS_FATAL ANY)
file(GLOB wheel ${FOLDER}/wheel/zulmetadata-${VERSION}-*.whl)
execute_process(COMMAND ${pip} install --root-user-action=ignore --no-index --no-deps --target ${FOLDER}/installed ${wheel}
  COMMAND_ERROR_IS_FATAL ANY)
execute_process(COMMAND ${CMAKE_COMMAND} -E env PYTHONPATH=${FOLDER}/installed ${PYTHON} -c
    "import zulmetadata as z; z.write_stream('a.dat', 'cpuUsage', [(1, 0.5)]); print(z.Recording('a.dat')['cpuUsage'], z.__file__)"
  WORKING_DIRECTORY ${FOLDER} OUTPUT_VARIABLE printed COMMAND_ERROR_IS_FATAL ANY)
if(NOT printed STREQUAL "[(1., 0.5)] ${FOLDER}/installed/zulmetadata/__init__.py\n")
  message(FATAL_ERROR "The installed package printed: ${printed}")
endif()
foreach(file IN ITEMS py.typed _core.pyi)
  if(NOT EXISTS ${FOLDER}/installed/zulmetadata/${file})
    message(FATAL_ERROR "${file} is not installed")
  endif()
endforeach()
