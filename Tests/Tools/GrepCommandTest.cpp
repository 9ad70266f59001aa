#include "Tests/Tools/RecordedSession.h"
#include "Tests/Tools/ToolRun.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include <filesystem>

namespace ZULMetaData::Test {
namespace {

using Json = nlohmann::json;
using testing::HasSubstr;

class GrepCommand : public RecordedSession {
protected:
    std::string write(const std::string& name, const std::string& contents) const {
        writeFile(folder / name, contents);
        return folder / name;
    }

    /// "Abc" at 0.5 and "Notes" at 2 seconds.
    std::string names() const { return write("names.mp4", media() + zulmAtom({appNameStream()})); }

    std::string named(const std::string& text) const {
        return write("text.dat", streamHeader(s_appNames, 1, 0) + textEntry(1, text));
    }
};

TEST_F(GrepCommand, ShowsFileKindTimeAndText) {
    const ToolResult result = runTool({"grep", "^N.t", names()});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_EQ(result.output, names() + ":topmostAppName:2.000000: Notes\n");
}

TEST_F(GrepCommand, EndsWithFourWhereNothingMatches) {
    const ToolResult result = runTool({"grep", "budget", names()});
    EXPECT_EQ(result.exitCode, 4);
    EXPECT_EQ(result.output, "");
    EXPECT_EQ(runTool({"grep", "x", write("none.mp4", media())}).exitCode, 4);
}

TEST_F(GrepCommand, IgnoresCaseAndTakesFixedTextsWhereAsked) {
    EXPECT_EQ(runTool({"grep", "notes", names()}).exitCode, 4);
    EXPECT_EQ(runTool({"grep", "-i", "notes", names()}).exitCode, 0);
    const std::string file = named("a.c (1)");
    EXPECT_EQ(runTool({"grep", "-F", "a.c (", file}).exitCode, 0);
    EXPECT_EQ(runTool({"grep", "-F", "a?c", file}).exitCode, 4);
    EXPECT_EQ(runTool({"grep", "-i", "-F", "A.C", file}).exitCode, 0);
}

TEST_F(GrepCommand, FindsATextInEveryNormalForm) {
    const std::string joined = "Caf\xc3\xa9 \xc3\x85";        // NFC
    const std::string apart = "Cafe\xcc\x81 A\xcc\x8a";       // NFD
    const std::string angstrom = "Cafe\xcc\x81 \xe2\x84\xab"; // of neither form
    for (const std::string& stored : {joined, apart, angstrom})
        for (const std::string& pattern : {joined, apart, angstrom})
            EXPECT_EQ(runTool({"grep", "-F", pattern, named(stored)}).exitCode, 0) << stored << " by " << pattern;
    EXPECT_EQ(runTool({"grep", "f[\xc3\xa9x]", named(apart)}).exitCode, 0);
    EXPECT_EQ(runTool({"grep", "e\\x{301}", named(apart)}).exitCode, 0) << "as it is stored";
    EXPECT_EQ(runTool({"grep", "Cafe ", named(joined)}).exitCode, 4);
}

TEST_F(GrepCommand, SearchesEveryKindOfTextInARecording) {
    const std::string output = runTool({"grep", ".", movie()}).output;
    for (const char* kind : {"slideTitles", "slideText", "slideComment", "topmostAppName", "topmostWindowTitle"})
        EXPECT_THAT(output, HasSubstr(std::string(":") + kind + ":"));
    EXPECT_THAT(output, HasSubstr(":systemData:0.000000: OSVersion:1.2.3\n"));
}

TEST_F(GrepCommand, SearchesSystemDataToItsLastText) {
    std::string texts;
    for (const std::string text : {"1", "2", "3", "4", "fifth \xe9"})
        texts += textEntry(0, text);
    const std::string file =
        write("system.dat",
              streamHeader("2b7b6afc", 1, 0) + le32(static_cast<std::uint32_t>(4 + texts.size())) + le32(5) + texts);
    const ToolResult result = runTool({"grep", "\xc3\xa9", file});
    EXPECT_EQ(result.exitCode, 0) << result.errors;
    EXPECT_THAT(result.output, HasSubstr(": fifth \xc3\xa9\n"));
}

TEST_F(GrepCommand, RefusesKindsWithoutTexts) {
    for (const char* kind :
         {"cursorLocation", "keyboardAction", "caretPosition", "2b7b6af2-7a1f-11e2-83d0-0017f200be7f"}) {
        const ToolResult result = runTool({"grep", ".", movie(), "--stream", kind});
        EXPECT_EQ(result.exitCode, 2) << kind;
        EXPECT_EQ(result.output, "");
        EXPECT_THAT(result.errors, HasSubstr("has no text to search; choose from slideTitles, slideText, slideComment, "
                                             "systemData, topmostAppName, topmostWindowTitle"));
    }
}

TEST_F(GrepCommand, FindsWhatDoesNotMatch) {
    EXPECT_EQ(runTool({"grep", "-v", "^N.t", names()}).output, names() + ":topmostAppName:0.500000: Abc\n");
    EXPECT_EQ(runTool({"grep", "--invert-match", ".", names()}).exitCode, 4);
    EXPECT_EQ(runTool({"-v", "grep", "Notes", names()}).exitCode, 0); // the option of every command
}

TEST_F(GrepCommand, ListsOnlyTheFiles) {
    const std::string other = named("nothing");
    const ToolResult result = runTool({"grep", "-l", "Notes", other, names()});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.output, names() + "\n");
    EXPECT_EQ(runTool({"grep", "-l", "nowhere", other, names()}).exitCode, 4);
}

TEST_F(GrepCommand, CountsTheMatchesOfEveryFile) {
    const std::string other = named("nothing");
    EXPECT_EQ(runTool({"grep", "-c", "[No]", other, names()}).output, other + ":1\n" + names() + ":1\n");
    const ToolResult none = runTool({"grep", "--count", "nowhere", names()});
    EXPECT_EQ(none.exitCode, 4);
    EXPECT_EQ(none.output, names() + ":0\n");
}

TEST_F(GrepCommand, PrintsOnlyTheParts) {
    const std::string file = named("one 1 two 22 \xc3\xa4 3");
    const std::string start = file + ":topmostAppName:1.000000: ";
    EXPECT_EQ(runTool({"grep", "-o", "[0-9]+", file}).output, start + "1\n" + start + "22\n" + start + "3\n");
    EXPECT_EQ(runTool({"grep", "-o", "\\b[a-z]", file}).output, start + "o\n" + start + "t\n");
    EXPECT_EQ(runTool({"grep", "-o", "x*", file}).output, ""); // it matches, but only what is empty
}

TEST_F(GrepCommand, PrintsTheComposedPartsOfADecomposedText) {
    const std::string file = named("Mu\xcc\x88ller 1");
    EXPECT_EQ(runTool({"grep", "-o", "M\xc3\xbcller", file}).output,
              file + ":topmostAppName:1.000000: M\xc3\xbcller\n");
}

TEST_F(GrepCommand, SearchesFolders) {
    std::filesystem::create_directories(folder.path() / "a" / "b");
    const std::string first = write("a/b/first.mp4", media() + zulmAtom({appNameStream()}));
    const std::string second = write("a/second.dat", streamHeader(s_appNames, 1, 0) + textEntry(1, "Notes"));
    write("a/notes.txt", "Notes");
    std::filesystem::create_directory_symlink(folder.path() / "a", folder.path() / "a" / "again");
    const ToolResult result = runTool({"grep", "-rl", "Notes", folder / "a"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.errors, "");
    EXPECT_EQ(result.output, first + '\n' + second + '\n');
    const ToolResult without = runTool({"grep", "Notes", folder / "a"});
    EXPECT_EQ(without.exitCode, 1);
    EXPECT_THAT(without.errors, HasSubstr("is a folder"));
    const Json document = Json::parse(runTool({"grep", "-r", "--json", "Notes", folder / "a"}).output);
    EXPECT_EQ(document["files"].size(), 2U);
    EXPECT_EQ(document["files"][1]["path"], second);
}

TEST_F(GrepCommand, SaysNothingWhenQuiet) {
    const ToolResult found = runTool({"grep", "-q", "Notes", names(), folder / "none.mp4"});
    EXPECT_EQ(found.exitCode, 0); // the first match ends the search
    EXPECT_EQ(found.output + found.errors, "");
    const ToolResult nothing = runTool({"grep", "-q", "nowhere", names()});
    EXPECT_EQ(nothing.exitCode, 4);
    EXPECT_EQ(nothing.output + nothing.errors, "");
}

TEST_F(GrepCommand, RefusesOptionsThatContradictEachOther) {
    for (const std::vector<std::string>& options : std::vector<std::vector<std::string>>{
             {"-l", "-c"}, {"-l", "-o"}, {"-c", "-o"}, {"-o", "-v"}, {"-l", "--json"}, {"-c", "--json"}}) {
        std::vector<std::string> arguments{"grep", "x", "a.mp4"};
        arguments.insert(arguments.end(), options.begin(), options.end());
        const ToolResult result = runTool(arguments);
        EXPECT_EQ(result.exitCode, 2) << options[0] << options[1];
        EXPECT_THAT(result.errors, HasSubstr("cannot be given together with"));
    }
}

TEST_F(GrepCommand, SearchesOnlyTheChosenKinds) {
    EXPECT_THAT(runTool({"grep", ".", movie(), "--stream", "slideText"}).output,
                testing::Not(HasSubstr("slideTitles")));
}

TEST_F(GrepCommand, SearchesOnBehindAFileThatCannotBeRead) {
    const ToolResult result = runTool({"grep", "Notes", folder / "missing.mp4", names()});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.errors, HasSubstr("missing.mp4: no such file"));
    EXPECT_THAT(result.output, HasSubstr("Notes"));
}

TEST_F(GrepCommand, FindsInOneOfSeveralFiles) {
    const std::string none = write("none.mp4", media());
    EXPECT_EQ(runTool({"grep", "Notes", none, names()}).exitCode, 0);
    EXPECT_EQ(runTool({"grep", "Notes", names(), none}).exitCode, 0);
}

TEST_F(GrepCommand, SaysWhatCouldNotBeSearched) {
    const std::string file = write("torn.dat", appNameStream() + le32(100) + f64(3) + "Notes");
    const ToolResult result = runTool({"grep", "Notes", file});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_THAT(result.output, HasSubstr(":2.000000: Notes"));
    EXPECT_THAT(result.errors, HasSubstr("cannot be searched from offset 56 on; 'zulm verify"));
}

TEST_F(GrepCommand, ShowsTextsThatAreNotUTF8OrWouldMoveTheTerminal) {
    const ToolResult result = runTool({"grep", "Not", named("Not\xff\x1b[2Jes")});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.output, HasSubstr("Not\\xff\\x1b[2Jes"));
}

TEST_F(GrepCommand, SearchesAndShowsWhatFollowsAZeroByte) {
    const std::string file = named(std::string("Not\0es \xff", 8));
    const ToolResult result = runTool({"grep", "es", file});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_THAT(result.output, HasSubstr(": Not\\x00es \\xff\n"));
    const Json match = Json::parse(runTool({"grep", "es", file, "--json"}).output)["files"][0]["matches"][0];
    EXPECT_EQ(match["text"], std::string("Not\0es \xef\xbf\xbd", 10));
    EXPECT_EQ(match["text_base64"], "Tm90AGVzIP8=");
}

TEST_F(GrepCommand, TakesNoLongerForAnExpressionMeantToHang) {
    EXPECT_EQ(runTool({"grep", "(a*)*(a*)*(a*)*b$", named(std::string(100000, 'a'))}).exitCode, 4);
    EXPECT_EQ(runTool({"grep", "((((x{100}){100}){100}){100})", names()}).exitCode, 2);
}

TEST_F(GrepCommand, RefusesWhatIsNoExpression) {
    const ToolResult result = runTool({"grep", "(", names()});
    EXPECT_EQ(result.exitCode, 2);
    EXPECT_THAT(result.errors, HasSubstr("( is no regular expression: missing )"));
    EXPECT_EQ(runTool({"grep", "-F", "(", names()}).exitCode, 4);
}

TEST_F(GrepCommand, ReportsAsJSON) {
    const Json report = Json::parse(runTool({"grep", "o", names(), "--json"}).output);
    EXPECT_EQ(report["schema"], "zulm.grep");
    EXPECT_EQ(report["files"][0]["path"], names());
    EXPECT_EQ(report["files"][0]["matches"],
              Json::parse(R"([{"stream": "topmostAppName", "timestamp": 2.0, "text": "Notes"}])"));
}

} // namespace
} // namespace ZULMetaData::Test
