# macOS, from Linux: zig's clang with the headers and library stubs that it carries. ZULM_MACOS_PROCESSOR is aarch64 or
# x86_64, ZULM_ZIG the program, ZULM_MACOS_DEPENDENCIES what scripts/check-macos.sh has prepared of other libraries.
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES ZULM_MACOS_PROCESSOR ZULM_ZIG ZULM_MACOS_DEPENDENCIES)

set(CMAKE_SYSTEM_NAME Darwin)
set(CMAKE_SYSTEM_PROCESSOR ${ZULM_MACOS_PROCESSOR})
set(CMAKE_CXX_COMPILER ${ZULM_ZIG} c++ -target ${ZULM_MACOS_PROCESSOR}-macos)
set(CMAKE_CXX_FLAGS_INIT "-isystem ${ZULM_MACOS_DEPENDENCIES}/include")

# The platform's own tools, which zig has within it.
set(CMAKE_AR ${ZULM_ZIG})
set(CMAKE_RANLIB ${ZULM_ZIG})
set(CMAKE_INSTALL_NAME_TOOL ${CMAKE_COMMAND})
set(CMAKE_CXX_ARCHIVE_CREATE "<CMAKE_AR> ar qc <TARGET> <OBJECTS>")
set(CMAKE_CXX_ARCHIVE_APPEND "<CMAKE_AR> ar q <TARGET> <OBJECTS>")
set(CMAKE_CXX_ARCHIVE_FINISH "<CMAKE_RANLIB> ranlib <TARGET>")
