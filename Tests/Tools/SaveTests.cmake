# The commands that change movies. AttachCommandTest runs ffmpeg.
find_package(nlohmann_json REQUIRED)
foreach(command Attach Repair Stamp)
  zulm_add_tool_test(Tools/${command}CommandTest)
  target_link_libraries(Tools.${command}CommandTest PRIVATE nlohmann_json::nlohmann_json)
endforeach()
