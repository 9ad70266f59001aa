# Builds for WebAssembly with the Emscripten that is installed: cmake -DCMAKE_TOOLCHAIN_FILE=cmake/wasm32-emscripten.cmake
find_program(EM_CONFIG em-config REQUIRED)
execute_process(COMMAND ${EM_CONFIG} EMSCRIPTEN_ROOT OUTPUT_VARIABLE emscripten
  OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
include(${emscripten}/cmake/Modules/Platform/Emscripten.cmake)
