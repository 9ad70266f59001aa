#pragma once

// Runs `zulm` as a user does: as a process, with its output on a pipe, a terminal, or nowhere.
//
//     const ToolResult result = runTool({"info", "--json", movie});
//     EXPECT_EQ(result.exitCode, 0) << result.errors;

#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {

/// Where the standard output or the standard error of a program leads.
enum class Channel {
    Pipe,       ///< read by the test
    Terminal,   ///< a pseudo-terminal of 80 columns, read by the test; lines end with CR LF
    Closed,     ///< the descriptor is closed
    BrokenPipe, ///< a pipe that nobody reads any more
    FullDisk,   ///< /dev/full
};

struct ToolOptions {
    std::vector<std::pair<std::string, std::string>> environment; ///< added to the test's own
    std::string input;                                            ///< on standard input, through a pipe
    bool keepsInputOpen = false;                                  ///< behind it, until the program ends
    Channel output = Channel::Pipe;
    Channel errors = Channel::Pipe;
    int slownessMilliseconds = 0;                         ///< waited before every read of standard output
    std::string folder;                                   ///< to start in; the test's own where empty
    int killAfterMilliseconds = 0;                        ///< sends `killSignal` then; 0 is never
    std::function<bool()> killWhen = [] { return true; }; ///< but not before this is true
    int killSignal = 15;
    std::function<void()> beforeKill = [] {};
};

struct ToolResult {
    int exitCode = -1; ///< 128 + n where signal n ended it
    std::string output;
    std::string errors;
    long peakMemoryKB = 0;
};

/// Fails the test where the program cannot be started or runs for more than two minutes.
ToolResult runProgram(const std::string& program, const std::vector<std::string>& arguments,
                      const ToolOptions& options = {});

/// The same for the `zulm` of this build.
ToolResult runTool(const std::vector<std::string>& arguments, const ToolOptions& options = {});

} // namespace ZULMetaData::Test
