# The commands that take streams out of files, compare and search them. ConvertCommandTest runs ffmpeg and ffprobe.
find_package(nlohmann_json REQUIRED)
foreach(command Convert Diff Extract Grep Redact Salvage)
  zulm_add_tool_test(Tools/${command}CommandTest)
  target_link_libraries(Tools.${command}CommandTest PRIVATE nlohmann_json::nlohmann_json)
endforeach()
