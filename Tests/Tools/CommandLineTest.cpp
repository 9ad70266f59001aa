// What all commands have in common: help, wrong arguments, colour, progress, outputs that fail.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>

#include <csignal>
#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using testing::AllOf;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

constexpr auto s_escape = "\x1b[";

class CommandLine : public RecordedSession {
protected:
    void expectRefused(const std::vector<std::string>& arguments, const std::string& message) const {
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 2) << message;
        EXPECT_EQ(result.output, "");
        EXPECT_THAT(result.errors, AllOf(StartsWith("zulm: "), HasSubstr(message), HasSubstr("--help' shows")));
    }

    std::string damaged() const {
        writeFile(folder / "torn.dat", locations() + "1234");
        return folder / "torn.dat";
    }
};

TEST_F(CommandLine, HelpGroupsTheCommandsAndEndsWellOnStandardOutput) {
    const ToolResult result = runTool({"--help"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.errors, "");
    for (const std::string part : {"\nLook\n  info ", "\nCheck and rescue\n  verify ", "\nChange\n  attach ",
                                   "\nConvert\n  extract ", "\nExamples\n  zulm ", "\nExit codes\n  0 ", "--json"})
        EXPECT_THAT(result.output, HasSubstr(part));
}

TEST_F(CommandLine, HelpOfEveryCommandHasItsUsageAndAnExample) {
    for (const std::string command : {"info", "atoms", "dump", "diff", "grep", "view", "verify", "repair", "salvage",
                                      "attach", "stamp", "redact", "extract", "convert", "demo"}) {
        const ToolResult result = runTool({command, "--help"});
        EXPECT_EQ(result.exitCode, 0);
        EXPECT_THAT(result.output, HasSubstr("\nUsage: zulm " + command + " [OPTIONS]"));
        EXPECT_THAT(result.output, testing::ContainsRegex("\nExamples?\n  zulm " + command));
    }
}

TEST_F(CommandLine, TellsItsVersion) {
    EXPECT_THAT(runTool({"--version"}).output, StartsWith("zulm 0."));
}

TEST_F(CommandLine, RefusesWrongArguments) {
    expectRefused({}, "no command is given");
    expectRefused({"--quiet"}, "no command is given");
    expectRefused({"inof", "a.mp4"}, "no command is called inof; did you mean info?");
    expectRefused({"xyzzy"}, "no command is called xyzzy\n");
    expectRefused({"info"}, "FILE is required");
    expectRefused({"info", "--jsno", "a.mp4"}, "no option is called --jsno; did you mean --json?");
    expectRefused({"info", "--no-progres", "a.mp4"}, "did you mean --no-progress?");
    expectRefused({"repair", "a.mp4", "b.mp4"}, "b.mp4 is one argument too many");
    expectRefused({"dump", "--format", "jsn", "a.mp4"},
                  "--format: jsn is not one of text, json, ndjson, csv; did you mean json?");
    expectRefused({"dump", "--from", "2", "--to", "1", "a.mp4"}, "--from: 2 is later than --to 1");
    expectRefused({"info", "--color", "sometimes", "a.mp4"}, "--color: sometimes is not one of auto, always, never");
    expectRefused({"info", "-q", "-v", "a.mp4"}, "--quiet cannot be given together with --verbose");
    expectRefused({"repair", "--force", "--in-place", "a.mp4"}, "--force can only be given together with --output");
    expectRefused({"--json", "info", "a.mp4"}, "--json is an option of 'zulm info': it follows info");
    expectRefused({"info", "--jsno=1", "a.mp4"}, "no option is called --jsno; did you mean --json?");
    expectRefused({"info", "--json=3", "a.mp4"}, "--json takes no value");
    expectRefused({"info", "--quiet=no", "a.mp4"}, "--quiet takes no value");
    expectRefused({"dump", "a.mp4", "--from"}, "--from is given without its value");
    expectRefused({"dump", "a.mp4", "--from", "1", "--from", "2"}, "--from is given more than once");
    expectRefused({"dump", "--stream=", "a.mp4"}, "--stream: no kind of stream is called ''");
    expectRefused({"--generate", "pdf"}, "nothing is generated as pdf");
}

TEST_F(CommandLine, RefusesWhatIsNoNumber) {
    for (const std::string word : {"", " ", "nan", "inf", "-inf", "0x1", "1e400", "soon", "1s", "1:75", "1:2:3:4"}) {
        for (const std::string option : {"--from", "--to"})
            expectRefused({"dump", option + "=" + word, "a.mp4"}, option + ": '" + word + "' is not a time");
        expectRefused({"convert", "--to", "srt", "--pause=" + word, "a.mp4"}, "--pause: '" + word + "' is not a time");
        expectRefused({"diff", "--limit=" + word, "a.mp4", "b.mp4"},
                      "--limit: '" + word + "' is not a whole number such as 0 or 100");
    }
    expectRefused({"convert", "--to", "srt", "--pause", "-1", "a.mp4"}, "--pause: '-1' is not a time");
    expectRefused({"convert", "--to", "srt", "--pause", "0", "a.mp4"}, "--pause: 0 is not from 0.001 to 3600 seconds");
    expectRefused({"dump", "--from", "", "a.mp4"}, "--from: '' is not a time");
    expectRefused({"diff", "--limit", "-1", "a.mp4", "b.mp4"}, "--limit: '-1' is not a whole number");
    expectRefused({"diff", "--limit", "1.5", "a.mp4", "b.mp4"}, "--limit: '1.5' is not a whole number");
}

TEST_F(CommandLine, TakesTimeCodesForSeconds) {
    const std::string file = folder / "locations.dat";
    writeFile(file, locations());
    const std::string bySeconds = runTool({"dump", "--from", "0.5", "--to", "1e3", file}).output;
    EXPECT_NE(bySeconds, "");
    EXPECT_EQ(runTool({"dump", "--from", "0:00.5", "--to", "0:16:40", file}).output, bySeconds);
    EXPECT_EQ(runTool({"dump", "--from", "-0:10", file}).output, runTool({"dump", file}).output);
}

TEST_F(CommandLine, ShowsNoHelpOfACommandThatDoesNotExist) {
    expectRefused({"inof", "--help"}, "no command is called inof; did you mean info?");
    expectRefused({"--help", "inof"}, "no command is called inof; did you mean info?");
    expectRefused({"xyzzy", "a.mp4", "-h"}, "no command is called xyzzy\n");
    expectRefused({"xyzzy", "--version"}, "no command is called xyzzy\n");
    expectRefused({"help", "inof"}, "no command is called inof; did you mean info?");
    EXPECT_EQ(runTool({"help"}).output, runTool({"--help"}).output);
    EXPECT_EQ(runTool({"help", "info"}).output, runTool({"info", "--help"}).output);
    EXPECT_EQ(runTool({"info", "a.mp4", "--help"}).exitCode, 0);
    EXPECT_EQ(runTool({"--quiet", "--help"}).exitCode, 0);
}

TEST_F(CommandLine, MakesNoFileThatIsCalledLikeStandardOutput) {
    ToolOptions options;
    options.folder = folder.path().string();
    const std::string stream = streamFile("cpuUsage");
    for (const auto& arguments : std::vector<std::vector<std::string>>{
             {"attach", movie(), stream, "-o", "-"},
             {"stamp", movie(), "--creator", "a", "--creator-version", "1", "-o", "-"},
             {"repair", movie(), "--output", "-"},
             {"redact", movie(), "--keys", "-o", "-"},
             {"view", movie(), "--output=-"},
             {"extract", movie(), "-o", "-"},
             {"salvage", movie(), "-o-"},
             {"dump", movie(), "--images", "-"},
             {"demo", "-"}}) {
        const ToolResult result = runTool(arguments, options);
        EXPECT_EQ(result.exitCode, 2) << arguments.front();
        EXPECT_THAT(result.errors, HasSubstr("'-' does not stand for standard output here")) << arguments.front();
    }
    EXPECT_TRUE(std::filesystem::is_empty(folder.path()));
    EXPECT_THAT(runTool({"convert", "--to", "srt", movie(), "-o", "-"}, options).output, StartsWith("1\n"));
}

TEST_F(CommandLine, SaysWhatIsWrongWithTheFolderForTemporaryFiles) {
    ToolOptions options;
    options.input = locations();
    options.environment = {{"TMPDIR", folder / "none"}};
    const ToolResult missing = runTool({"info", "-"}, options);
    EXPECT_EQ(missing.exitCode, 1);
    EXPECT_THAT(missing.errors, HasSubstr("-: standard input cannot be kept in a temporary file, because TMPDIR names "
                                          "no folder; set it to one, or unset it"));
}

TEST_F(CommandLine, SaysWhatIsNoFile) {
    const ToolResult folders = runTool({"info", folder.path().string()});
    EXPECT_EQ(folders.exitCode, 1);
    EXPECT_EQ(folders.errors, "zulm: " + folder.path().string() + ": is a folder; name the files in it\n");
    EXPECT_EQ(runTool({"info", ""}).errors, "zulm: '' is the name of no file\n");
}

TEST_F(CommandLine, PrintsNotWhatWasDoneWhenQuiet) {
    const std::string copy = copyOf(movie());
    for (const auto& arguments : std::vector<std::vector<std::string>>{
             {"attach", copy, streamFile("cpuUsage"), "--replace", "-o", folder / "attached.mp4"},
             {"stamp", copy, "--creator", "a", "--creator-version", "1", "-o", folder / "stamped.mp4"},
             {"repair", copy, "-o", folder / "repaired.mp4"},
             {"redact", copy, "--keys", "-o", folder / "redacted.mp4"},
             {"extract", copy, "-o", folder / "extracted"},
             {"salvage", copy, "-o", folder / "salvaged"},
             {"verify", copy}}) {
        std::vector<std::string> quiet = arguments;
        quiet.emplace_back("-q");
        const ToolResult result = runTool(quiet);
        EXPECT_EQ(result.exitCode, 0) << arguments.front();
        EXPECT_EQ(result.output + result.errors, "") << arguments.front();
    }
    EXPECT_EQ(runTool({"info", "-q", copy}).output, runTool({"info", copy}).output);
    EXPECT_EQ(runTool({"dump", "-q", copy}).output, runTool({"dump", copy}).output);
    EXPECT_NE(runTool({"verify", "-q", damaged()}).output, "");
}

TEST_F(CommandLine, TakesAFileThatIsNamedLikeACommand) {
    writeFile(folder / "info", "");
    ToolOptions options;
    options.folder = folder.path().string();
    EXPECT_THAT(runTool({"info", "info"}, options).errors, HasSubstr("info: begins neither like a movie"));
}

TEST_F(CommandLine, TakesOptionsOfEveryCommandOnEitherSideOfIt) {
    for (const auto& arguments : {std::vector<std::string>{"--quiet", "info", damaged()}, {"info", damaged(), "-q"}})
        EXPECT_EQ(runTool(arguments).errors, "");
}

TEST_F(CommandLine, SaysWhatItDoesWhenVerbose) {
    const ToolResult result = runTool({"--verbose", "dump", "--stream", "cpuUsage", movie()});
    EXPECT_THAT(result.errors, HasSubstr("movie with 17 streams"));
    EXPECT_THAT(result.errors, HasSubstr("40 entries of cpuUsage read"));
    EXPECT_EQ(runTool({"dump", "--stream", "cpuUsage", movie()}).errors, "");
}

TEST_F(CommandLine, ColoursHeadingsOnATerminal) {
    ToolOptions options;
    options.output = Channel::Terminal;
    options.environment = {{"TERM", "xterm"}, {"NO_COLOR", ""}};
    EXPECT_THAT(runTool({"info", movie()}, options).output, HasSubstr(s_escape));
    EXPECT_THAT(runTool({"--color", "never", "info", movie()}, options).output, Not(HasSubstr(s_escape)));
    options.environment = {{"TERM", "xterm"}, {"NO_COLOR", "1"}};
    EXPECT_THAT(runTool({"info", movie()}, options).output, Not(HasSubstr(s_escape)));
    options.environment = {{"TERM", "dumb"}, {"NO_COLOR", ""}};
    EXPECT_THAT(runTool({"info", movie()}, options).output, Not(HasSubstr(s_escape)));
}

TEST_F(CommandLine, ColoursAPipeOnlyWhenToldTo) {
    EXPECT_THAT(runTool({"info", movie()}).output, Not(HasSubstr(s_escape)));
    EXPECT_THAT(runTool({"info", "--color", "always", movie()}).output, HasSubstr(s_escape));
    EXPECT_THAT(runTool({"info", damaged(), "--color", "always"}).errors, HasSubstr(s_escape));
    EXPECT_THAT(runTool({"info", damaged()}).errors, Not(HasSubstr(s_escape)));
    EXPECT_THAT(runTool({"info", "--json", "--color", "always", movie()}).output, Not(HasSubstr(s_escape)));
}

TEST_F(CommandLine, ShowsProgressOnATerminalOnly) {
    std::string stream = streamHeader("2b7b6af2", 1, 16);
    for (int i = 0; i < 20000; ++i)
        stream += pointEntry(i, i, i);
    writeFile(folder / "many.dat", stream);
    const std::vector<std::string> dump{"dump", "--format", "ndjson", folder / "many.dat"};
    const auto withOption = [&](const std::string& option) {
        auto arguments = dump;
        arguments.push_back(option);
        return arguments;
    };
    ToolOptions options;
    options.errors = Channel::Terminal;
    options.slownessMilliseconds = 50; // so that it takes longer than half a second
    EXPECT_THAT(runTool(dump, options).errors,
                testing::ContainsRegex("reading cursorLocation: [0-9.]+ kB of 320.0 kB \\([0-9]+ %\\), [0-9]+ s left"));
    EXPECT_EQ(runTool(withOption("--no-progress"), options).errors, "");
    EXPECT_EQ(runTool(withOption("--quiet"), options).errors, "");
    options.errors = Channel::Pipe;
    EXPECT_EQ(runTool(dump, options).errors, "");
}

TEST_F(CommandLine, FailsWhenTheDiskIsFull) {
    ToolOptions options;
    options.output = Channel::FullDisk;
    for (const auto& arguments : {std::vector<std::string>{"info", movie()},
                                  {"info", "--json", movie()},
                                  {"atoms", movie()},
                                  {"dump", movie()},
                                  {"--help"},
                                  {"--version"},
                                  {"--generate", "man"}}) {
        const ToolResult result = runTool(arguments, options);
        EXPECT_EQ(result.exitCode, 1) << arguments.front();
        EXPECT_EQ(result.errors, "zulm: standard output: cannot be written: No space left on device\n");
    }
}

TEST_F(CommandLine, FailsIfStandardOutputIsClosed) {
    ToolOptions options;
    options.output = Channel::Closed;
    for (const auto& arguments : {std::vector<std::string>{"info", movie()},
                                  {"info", "--json", movie()},
                                  {"dump", movie()},
                                  {"--help"},
                                  {"convert", "--to", "srt", movie()}}) {
        const ToolResult result = runTool(arguments, options);
        EXPECT_EQ(result.exitCode, 1) << arguments.front();
        EXPECT_EQ(result.errors, "zulm: standard output: is closed, so the result could not be printed\n");
    }
}

TEST_F(CommandLine, WritesFilesAlthoughStandardOutputIsClosed) {
    ToolOptions options;
    options.output = Channel::Closed;
    const std::string captions = folder / "captions.srt";
    EXPECT_EQ(runTool({"convert", "--to", "srt", movie(), "-o", captions}, options).exitCode, 0);
    EXPECT_THAT(contentsOf(captions), StartsWith("1\n"));
    const std::string copy = folder / "copy.mp4";
    EXPECT_EQ(runTool({"-q", "redact", movie(), "-o", copy, "--keys"}, options).exitCode, 0);
    EXPECT_EQ(runTool({"verify", copy}).exitCode, 0);
}

TEST_F(CommandLine, FailsQuietlyWhenNobodyListens) {
    ToolOptions options;
    options.output = Channel::BrokenPipe;
    const ToolResult broken = runTool({"dump", movie()}, options);
    EXPECT_EQ(broken.exitCode, 128 + SIGPIPE);
    EXPECT_EQ(broken.errors, "");
    const ToolResult ignored = runProgram(
        "bash", {"-c", "trap '' PIPE; set -o pipefail; '" ZULM_PATH "' dump --format json '" + movie() + "' | true"});
    EXPECT_EQ(ignored.exitCode, 1);
    EXPECT_EQ(ignored.errors, "");
}

TEST_F(CommandLine, KeepsWhatItPrintsOutOfTheFilesThatItOpens) {
    const std::string copy = copyOf(movie());
    const std::string before = contentsOf(copy);
    ToolOptions options;
    options.output = Channel::Closed;
    options.errors = Channel::Closed;
    runTool({"-v", "attach", copy, streamFile("cpuUsage"), "--replace", "--in-place"}, options);
    const std::string after = contentsOf(copy);
    EXPECT_EQ(after.substr(0, before.size()), before);
    EXPECT_THAT(after, Not(HasSubstr("zulm:")));
}

TEST_F(CommandLine, SuggestsCommandsThatCanBePasted) {
    const std::string file = folder / "my $movie.mp4";
    writeFile(file, contentsOf(movie()).substr(0, contentsOf(movie()).size() - 1));
    const std::string suggestion = R"(zulm verify ")" + folder.path().string() + R"(/my \$movie.mp4")";
    EXPECT_THAT(runTool({"info", file}).errors, HasSubstr("'" + suggestion + "'"));
}

TEST_F(CommandLine, SendsNoControlCharactersOfAFileNameToATerminal) {
    const std::string file = folder / "a\x1b[31m\xc2\x9b.mp4";
    writeFile(file, contentsOf(movie()).substr(0, contentsOf(movie()).size() - 1));
    for (const char* command : {"info", "verify", "atoms", "dump"}) {
        const ToolResult result = runTool({command, file});
        EXPECT_THAT(result.output + result.errors, Not(HasSubstr("\x1b"))) << command;
        EXPECT_THAT(result.output + result.errors, Not(HasSubstr("\xc2\x9b"))) << command;
    }
}

TEST_F(CommandLine, EndsWithTheNumberOfTheSignal) {
    ToolOptions options;
    options.input = tinyMovie();
    options.keepsInputOpen = true;
    options.killAfterMilliseconds = 200;
    for (const int signal : {SIGINT, SIGTERM, SIGHUP, SIGKILL}) {
        options.killSignal = signal;
        EXPECT_EQ(runTool({"info", "-"}, options).exitCode, 128 + signal);
    }
}

} // namespace
} // namespace ZULMetaData::Test
