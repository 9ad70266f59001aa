// The harness itself: what it says about a program is true. Runs sh(1).

#include "Tests/Tools/ToolRun.h"
#include "Tests/Tools/RecordedSession.h"

namespace ZULMetaData::Test {
namespace {

ToolResult shell(const std::string& script, const ToolOptions& options = {}) {
    return runProgram("sh", {"-c", script}, options);
}

TEST(ToolRun, TellsOutputFromErrorsAndGivesTheExitCode) {
    const ToolResult result = shell("echo out; echo err >&2; exit 3");
    EXPECT_EQ(result.output, "out\n");
    EXPECT_EQ(result.errors, "err\n");
    EXPECT_EQ(result.exitCode, 3);
}

TEST(ToolRun, CountsASignalFrom128) {
    EXPECT_EQ(shell("kill -TERM $$").exitCode, 128 + 15);
    ToolOptions options;
    options.killAfterMilliseconds = 500;
    options.killSignal = 2;
    EXPECT_EQ(shell("exec sleep 60", options).exitCode, 128 + 2);
}

TEST(ToolRun, HandsOverInputEnvironmentAndFolder) {
    TemporaryFolder folder;
    ToolOptions options;
    options.input = std::string(1 << 20, 'x');
    options.environment = {{"COLOUR", "green"}};
    options.folder = folder.path().string();
    EXPECT_EQ(shell("wc -c; echo $COLOUR; pwd -P", options).output,
              "1048576\ngreen\n" + std::filesystem::canonical(folder.path()).string() + "\n");
}

TEST(ToolRun, OffersATerminalForEitherChannel) {
    ToolOptions options;
    options.errors = Channel::Terminal;
    EXPECT_EQ(shell("test -t 1 && echo one; test -t 2 && echo two >&2", options).errors, "two\r\n");
    options = {};
    options.output = Channel::Terminal;
    EXPECT_EQ(shell("test -t 1 && echo one", options).output, "one\r\n");
}

TEST(ToolRun, OffersOutputsThatFail) {
    for (const Channel channel : {Channel::Closed, Channel::FullDisk}) {
        ToolOptions options;
        options.output = channel;
        EXPECT_NE(shell("/bin/echo x", options).exitCode, 0);
    }
    ToolOptions options;
    options.output = Channel::BrokenPipe;
    EXPECT_EQ(shell("exec cat /dev/zero", options).exitCode, 128 + 13);
}

TEST_F(RecordedSession, RunsTheToolOnARecording) {
    const ToolResult result = runTool({"info", movie()});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_NE(result.output.find("cursorLocation"), std::string::npos);
    EXPECT_EQ(streamFiles().size(), 17U);
}

} // namespace
} // namespace ZULMetaData::Test
