// Commands on very many files, as a process: lists of files, several at once, and results in the order of the files.

#include "Tests/Tools/OddFiles.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <nlohmann/json.hpp>

#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;
using testing::Not;

const std::vector<std::vector<std::string>> s_commands{
    {"info"},
    {"info", "--json"},
    {"verify"},
    {"verify", "--json"},
    {"grep", "o", "--stream", "topmostAppName"},
    {"grep", "-c", "o"},
    {"grep", "--json", "o"},
    {"dump"},
    {"dump", "--format", "csv"},
    {"dump", "--format", "ndjson"},
    {"dump", "--format", "json"},
};

class ManyFiles : public RecordedSession {
protected:
    std::string written(const std::string& name, const std::string& bytes) const {
        writeFile(folder / name, bytes);
        return folder / name;
    }

    std::string named(const std::string& name, const std::string& text) const {
        return written(name, streamHeader("2b7b6a06", 1, 0) + textEntry(1, text));
    }

    /// Of every sort: large and small, whole, damaged, without metadata, unreadable, and not there.
    std::vector<std::string> files() const {
        std::vector<std::string> all;
        for (int i = 0; i < 4; ++i) {
            const std::string number = std::to_string(i);
            all.push_back(named("name" + number + ".dat", "Notes " + number));
            all.push_back(written("torn" + number + ".dat", locations() + "1234"));
            all.push_back(movie());
            all.push_back(folder / ("missing" + number + ".mp4"));
            all.push_back(written("plain" + number + ".mp4", tinyMovie()));
            all.push_back(written("text" + number + ".txt", "neither a movie nor a stream"));
            all.push_back(folder.path());
            all.push_back(written("odd" + number + ".mp4", oddMovie()));
        }
        return all;
    }

    /// Names of files, each with `end` after it.
    std::string list(const std::vector<std::string>& names, char end = '\n') const {
        std::string text;
        for (const std::string& name : names)
            text += name + end;
        return written("list", text);
    }

    static std::vector<std::string> joined(std::vector<std::string> words, const std::vector<std::string>& more) {
        words.insert(words.end(), more.begin(), more.end());
        return words;
    }
};

TEST_F(ManyFiles, PrintInTheirOrderWhateverTheNumberOfJobs) {
    const std::vector<std::string> all = files();
    const std::string names = list(all);
    for (const std::vector<std::string>& command : s_commands) {
        const ToolResult one = runTool(joined(command, all));
        EXPECT_EQ(one.exitCode, 1);
        for (const char* jobs : {"1", "3", "0"}) {
            const ToolResult several = runTool(joined(command, {"--files-from", names, "--jobs", jobs}));
            EXPECT_EQ(several.output, one.output) << testing::PrintToString(command) << jobs;
            EXPECT_EQ(several.errors, one.errors) << testing::PrintToString(command) << jobs;
            EXPECT_EQ(several.exitCode, 1);
        }
    }
}

TEST_F(ManyFiles, PrintWhatEachOfThemPrintsAlone) {
    std::string output;
    std::string errors;
    for (const std::string& file : files()) {
        const ToolResult alone = runTool({"verify", file});
        output += alone.output;
        errors += alone.errors;
    }
    const ToolResult together = runTool(joined({"verify", "--jobs", "3"}, files()));
    EXPECT_EQ(together.output, output);
    EXPECT_EQ(together.errors, errors);
}

TEST_F(ManyFiles, AreOneDocument) {
    const std::vector<std::string> all = files();
    const Json document = Json::parse(runTool({"verify", "--json", "--jobs", "3", "--files-from", list(all)}).output);
    ASSERT_EQ(document["files"].size(), 20U);
    EXPECT_EQ(document["files"][0]["path"], all[0]);
    EXPECT_EQ(document["files"][19]["path"], all[31]);
    ASSERT_EQ(document["errors"].size(), 16U);
    EXPECT_EQ(document["errors"][0], (Json{{"path", all[3]}, {"message", "no such file"}}));
    EXPECT_EQ(document["errors"][15]["path"], all[30]);
}

TEST_F(ManyFiles, EndWithTheWorstOfTheirEnds) {
    const std::string fine = named("fine.dat", "a");
    const std::string torn = written("torn.dat", locations() + "1234");
    const std::string plain = written("plain.mp4", tinyMovie());
    const auto code = [&](const std::vector<std::string>& names) {
        return runTool({"verify", "--files-from", list(names), "--jobs", "2"}).exitCode;
    };
    EXPECT_EQ(code({}), 0);
    EXPECT_EQ(code({fine, fine}), 0);
    EXPECT_EQ(code({fine, plain}), 4);
    EXPECT_EQ(code({torn, plain, fine}), 3);
    EXPECT_EQ(code({folder / "missing", torn}), 1);
    EXPECT_EQ(runTool({"grep", "a", "--files-from", list({fine, plain})}).exitCode, 0);
    EXPECT_EQ(runTool({"grep", "b", "--files-from", list({fine, plain})}).exitCode, 4);
    EXPECT_EQ(runTool({"grep", "b", "--files-from", list({})}).exitCode, 4);
}

TEST_F(ManyFiles, AreListedInLinesOrBetweenZeroBytes) {
    const std::string file = named("two\nlines.dat", "a");
    const std::string other = named("other.dat", "b");
    EXPECT_EQ(runTool({"grep", "-c", "a", "--files-from", list({other, "", other})}).output,
              other + ":0\n" + other + ":0\n");
    const ToolResult zero = runTool({"grep", "--json", "a", "--null", "--files-from", list({file, other}, '\0')});
    EXPECT_EQ(zero.exitCode, 0) << zero.errors;
    EXPECT_EQ(Json::parse(zero.output)["files"][0]["path"], file);
    const ToolResult forgotten = runTool({"info", "--files-from", list({file, other}, '\0')});
    EXPECT_EQ(forgotten.exitCode, 1);
    EXPECT_THAT(forgotten.errors, HasSubstr("list: the names in it end with zero bytes; add --null"));
    EXPECT_EQ(runTool({"info", "--null", other}).exitCode, 2);
}

TEST_F(ManyFiles, AreListedOnStandardInputToo) {
    const std::string other = named("other.dat", "b");
    ToolOptions options;
    options.input = other + "\n" + other;
    EXPECT_EQ(runTool({"grep", "-c", "b", "--files-from", "-", other}, options).output,
              other + ":1\n" + other + ":1\n" + other + ":1\n");
    const ToolResult twice = runTool({"info", "--files-from", "-", "-"}, options);
    EXPECT_EQ(twice.exitCode, 2);
    EXPECT_THAT(twice.errors, HasSubstr("standard input cannot be the list and a recording"));
    const ToolResult doubled = runTool({"info", "-", other, "-"}, options);
    EXPECT_EQ(doubled.exitCode, 2);
    EXPECT_THAT(doubled.errors, HasSubstr("standard input cannot be two recordings"));
    options.input = "-\n";
    options.folder = folder.path();
    EXPECT_THAT(runTool({"info", "--files-from", "-"}, options).errors, HasSubstr("./-: no such file"));
}

TEST_F(ManyFiles, NeedAListThatCanBeRead) {
    const ToolResult missing = runTool({"info", "--json", "--files-from", folder / "nowhere"});
    EXPECT_EQ(missing.exitCode, 1);
    EXPECT_THAT(missing.errors, HasSubstr("nowhere: the list of files cannot be opened: No such file"));
    EXPECT_EQ(Json::parse(missing.output)["errors"][0]["path"], folder / "nowhere");
    EXPECT_EQ(runTool({"info", "--files-from", folder.path()}).exitCode, 1);
    EXPECT_EQ(runTool({"info", "--jobs", "2"}).exitCode, 2);
    for (const char* jobs : {"-1", "two", "100000", ""})
        EXPECT_EQ(runTool({"info", "--jobs", jobs, movie()}).exitCode, 2) << jobs;
}

TEST_F(ManyFiles, EndAtTheFirstMatchOfAQuietSearch) {
    const std::vector<std::string> names{named("a.dat", "b"), folder / "missing", named("c.dat", "b")};
    EXPECT_EQ(runTool({"grep", "-q", "b", "--files-from", list(names)}).exitCode, 0);
    EXPECT_EQ(runTool({"grep", "-q", "b", "--jobs", "2", "--files-from", list(names)}).exitCode, 0);
    EXPECT_EQ(runTool({"grep", "-q", "x", "--jobs", "2", "--files-from", list(names)}).exitCode, 1);
}

TEST_F(ManyFiles, InFoldersAreSearchedAtOnceToo) {
    std::filesystem::create_directories(folder.path() / "a" / "b");
    std::string expected;
    for (const char* name : {"a/b/1.dat", "a/b/2.dat", "a/c.dat", "a/d.dat"})
        expected += named(name, "Notes") + '\n';
    EXPECT_EQ(runTool({"grep", "-rl", "Notes", folder / "a", "--jobs", "3"}).output, expected);
}

TEST_F(ManyFiles, StopWhenNobodyReadsTheResult) {
    ToolOptions options;
    options.output = Channel::FullDisk;
    const ToolResult full = runTool(joined({"info", "--jobs", "3"}, files()), options);
    EXPECT_EQ(full.exitCode, 1);
    EXPECT_THAT(full.errors, HasSubstr("standard output: cannot be written"));
    options.output = Channel::BrokenPipe;
    EXPECT_THAT(runTool(joined({"dump", "--jobs", "3"}, files()), options).errors, Not(HasSubstr("standard output")));
}

TEST_F(ManyFiles, ShowFilesAndBytesOnATerminal) {
    const std::string file = named("a.dat", "b");
    ToolOptions options;
    options.errors = Channel::Terminal;
    options.slownessMilliseconds = 50; // so that it takes longer than half a second
    const std::string names = list(std::vector<std::string>(30000, file));
    const ToolResult shown = runTool({"verify", "--files-from", names}, options);
    EXPECT_THAT(shown.errors, testing::ContainsRegex("[0-9]+ files, [0-9.]+ (kB|MB) \\([0-9]+ %\\), [0-9]+ s left"));
    EXPECT_TRUE(shown.errors.ends_with("\r\033[K")) << "nothing of it stays";
    EXPECT_EQ(runTool({"--no-progress", "verify", "--files-from", names}, options).errors, "");
}

} // namespace
} // namespace ZULMetaData::Test
