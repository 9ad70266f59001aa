// The manual page, the completions and Docs/tool.md, made by the tool from its own options. Runs groff(1), bash(1),
// zsh(1) and fish(1).

#include "Tests/Support/Files.h"
#include "Tests/Tools/ToolRun.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <map>
#include <regex>
#include <sstream>

namespace ZULMetaData::Test {
namespace {

using testing::HasSubstr;

std::string generated(const std::string& format) {
    const ToolResult result = runTool({"--generate", format});
    EXPECT_EQ(result.exitCode, 0);
    return result.output;
}

/// The commands, by what the help of the tool lists.
std::vector<std::string> commands() {
    std::vector<std::string> names;
    std::istringstream page(runTool({"--help"}).output);
    bool isInExamples = false;
    for (std::string line; std::getline(page, line);) {
        isInExamples |= line == "Options of every command";
        std::smatch match;
        if (!isInExamples && std::regex_search(line, match, std::regex("^  ([a-z]+)  ")))
            names.push_back(match[1]);
    }
    return names;
}

/// The long options of a command, by what its help lists.
std::vector<std::string> optionsOf(const std::string& command) {
    std::vector<std::string> names;
    const std::string page = runTool({"help", command}).output; // the recorder's too, which may not be there
    const std::regex option("\n  (?:-[a-zA-Z], )?(--[a-z-]+)");
    for (auto match = std::sregex_iterator(page.begin(), page.end(), option); match != std::sregex_iterator(); ++match)
        names.push_back((*match)[1]);
    return names;
}

class Completion {
public:
    explicit Completion(const std::string& shell) : script_(folder_ / ("zulm." + shell)) {
        writeFile(script_, generated(shell));
    }
    const std::string& script() const { return script_; }

    /// What bash offers for the last of these words.
    std::string ofBash(const std::string& words, int index) const {
        const ToolResult result = runProgram("bash", {"-c", "source '" + script_ + "'; COMP_WORDS=(" + words +
                                                                "); COMP_CWORD=" + std::to_string(index) +
                                                                "; _zulm; echo \"${COMPREPLY[@]}\""});
        EXPECT_EQ(result.errors, "");
        return result.output;
    }

    std::string ofFish(const std::string& line) const {
        ToolOptions options;
        options.environment = {{"HOME", folder_.path().string()}, {"XDG_CONFIG_HOME", folder_.path().string()}};
        return runProgram("fish", {"--no-config", "-c", "source '" + script_ + "'; complete -C '" + line + "'"},
                          options)
            .output;
    }

private:
    TemporaryFolder folder_;
    std::string script_;
};

TEST(Manual, NamesEveryOptionOfEveryCommandInEveryForm) {
    ASSERT_GE(commands().size(), 14U);
    const std::string man = std::regex_replace(generated("man"), std::regex("\\\\-"), "-");
    const std::string markdown = generated("markdown");
    const std::string bash = generated("bash");
    const std::string zsh = generated("zsh");
    const std::string fish = generated("fish");
    for (const std::string& command : commands()) {
        EXPECT_THAT(man, HasSubstr(".SS " + command + "\n"));
        EXPECT_THAT(markdown, HasSubstr("\n### " + command + "\n"));
        EXPECT_THAT(zsh, HasSubstr("\n        " + command + ") _arguments"));
        EXPECT_THAT(fish, HasSubstr("-a " + command + " "));
        std::smatch options;
        ASSERT_TRUE(std::regex_search(bash, options, std::regex("\n        " + command + "\\) options='([^']*)'")));
        for (const std::string& option : optionsOf(command)) {
            EXPECT_THAT(options[1].str() + ' ', HasSubstr(option + ' ')) << command;
            EXPECT_THAT(man, HasSubstr("\\fB" + option + "\\fR"));
            EXPECT_THAT(markdown, testing::ContainsRegex("`[^`]*" + option + "[ `]"));
            EXPECT_THAT(zsh, HasSubstr(option + "["));
            EXPECT_THAT(fish, HasSubstr("-l " + option.substr(2) + " "));
        }
    }
}

TEST(Manual, IsAPageThatGroffReadsWithoutAWarning) {
    TemporaryFolder folder;
    writeFile(folder / "zulm.1", generated("man"));
    const ToolResult result = runProgram("groff", {"-man", "-Tutf8", "-ww", folder / "zulm.1"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.errors, "");
    EXPECT_THAT(result.output, HasSubstr("Signal n ended the command"));
}

TEST(Manual, HasAPageOfTheRecorder) {
    TemporaryFolder folder;
    const std::string page = generated("man-record");
    for (const std::string& option : optionsOf("record"))
        EXPECT_THAT(std::regex_replace(page, std::regex("\\\\-"), "-"), HasSubstr("\\fB" + option + "\\fR"));
    writeFile(folder / "zulm-record.1", page);
    const ToolResult result = runProgram("groff", {"-man", "-Tutf8", "-ww", folder / "zulm-record.1"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.errors, "");
}

TEST(Manual, HasAPageOfTheRenderer) {
    TemporaryFolder folder;
    const std::string page = generated("man-render");
    for (const char* command : {"render", "guide"})
        for (const std::string& option : optionsOf(command))
            EXPECT_THAT(std::regex_replace(page, std::regex("\\\\-"), "-"), HasSubstr("\\fB" + option + "\\fR"));
    writeFile(folder / "zulm-render.1", page);
    const ToolResult result = runProgram("groff", {"-man", "-Tutf8", "-ww", folder / "zulm-render.1"});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.errors, "");
}

TEST(Manual, IsTheCommittedPage) {
    EXPECT_EQ(contentsOf(std::string(ZULM_DOCS) + "/tool.md"), generated("markdown"))
        << "bring it up to date: cmake --build BUILD --target zulm_docs";
}

TEST(BashCompletion, CompletesCommandsOptionsAndChoices) {
    const Completion completion("bash");
    EXPECT_EQ(runProgram("bash", {"-n", completion.script()}).errors, "");
    EXPECT_EQ(completion.ofBash("zulm ato", 1), "atoms\n");
    EXPECT_EQ(completion.ofBash("zulm dump --fo", 2), "--format --force\n");
    EXPECT_EQ(completion.ofBash("zulm dump --format nd", 3), "ndjson\n");
    EXPECT_EQ(completion.ofBash("zulm dump --stream cursorI", 3), "cursorImage\n");
    EXPECT_EQ(completion.ofBash("zulm --color al", 2), "always\n");
    EXPECT_EQ(completion.ofBash("zulm --color always inf", 3), "info\n");
    EXPECT_EQ(completion.ofBash("zulm dump --color ne", 3), "never\n");
}

/// Types into an interactive bash and prints what the tool would get: python3 has a terminal to type into.
constexpr auto s_typing = R"(
import os, pty, select, sys, time
script, folder, keys = sys.argv[1:]
child, terminal = pty.fork()
if child == 0:
    os.environ.update(PS1="", TERM="dumb", INPUTRC="/dev/null", HISTFILE="")
    os.chdir(folder)
    os.execvp("bash", ["bash", "--norc", "--noprofile", "-i"])
output = b""
def read_until(end):
    global output
    limit = time.time() + 20
    while end not in output and time.time() < limit:
        if select.select([terminal], [], [], 0.1)[0]:
            output += os.read(terminal, 4096)
    rest, output = output, b""
    return rest
os.write(terminal, b"stty -echo; zulm() { printf '<%s>' \"$@\"; echo END; }; source '" + script.encode() + b"'; echo REA''DY\n")
read_until(b"READY\r\n")
os.write(terminal, keys.encode() + b"\t\n")
answer = read_until(b"END\r\n").decode()
print(answer[answer.index("<"):answer.rindex(">") + 1] if "<" in answer else repr(answer))
os.write(terminal, b"exit\n")
)";

TEST(BashCompletion, CompletesFilesWhateverTheirNames) {
    TemporaryFolder folder;
    for (const std::string name : {"Recording.mp4", "My Recording.mp4", "Other's [1].mp4", "cost $5.mp4"})
        writeFile(folder / name, "");
    std::filesystem::create_directory(folder / "Its Folder");
    const Completion completion("bash");
    const auto typed = [&](const std::string& keys) {
        return runProgram("python3", {"-c", s_typing, completion.script(), folder.path().string(), keys}).output;
    };
    EXPECT_EQ(typed("zulm info Rec"), "<info><Recording.mp4>\n");
    EXPECT_EQ(typed("zulm info My"), "<info><My Recording.mp4>\n");
    EXPECT_EQ(typed("zulm info \"My R"), "<info><My Recording.mp4>\n");
    EXPECT_EQ(typed("zulm info My\\ R"), "<info><My Recording.mp4>\n");
    EXPECT_EQ(typed("zulm info Oth"), "<info><Other's [1].mp4>\n");
    EXPECT_EQ(typed("zulm info cost"), "<info><cost $5.mp4>\n");
    EXPECT_EQ(typed("zulm extract Recording.mp4 -o It"), "<extract><Recording.mp4><-o><Its Folder/>\n");
    EXPECT_EQ(typed("zulm extract Recording.mp4 -o Rec"), "<extract><Recording.mp4><-o><Rec>\n");
    EXPECT_EQ(typed("zulm dump --from Rec"), "<dump><--from><Rec>\n");
    EXPECT_EQ(typed("zulm dump --format nd"), "<dump><--format><ndjson>\n");
}

TEST(ZshCompletion, IsAScriptThatZshReads) {
    const Completion completion("zsh");
    EXPECT_EQ(runProgram("zsh", {"-n", completion.script()}).errors, "");
    const ToolResult loaded = runProgram("zsh", {"-f", "-c",
                                                 "autoload -U compinit && compinit -D -u && source '" +
                                                     completion.script() + "' && print $_comps[zulm]"});
    EXPECT_EQ(loaded.errors, "");
    EXPECT_EQ(loaded.output, "_zulm\n");
}

TEST(FishCompletion, CompletesCommandsOptionsAndChoices) {
    const Completion completion("fish");
    EXPECT_EQ(runProgram("fish", {"--no-config", "-n", completion.script()}).errors, "");
    EXPECT_THAT(completion.ofFish("zulm ato"), testing::StartsWith("atoms\t"));
    EXPECT_THAT(completion.ofFish("zulm dump --format nd"), testing::StartsWith("ndjson\t"));
    EXPECT_THAT(completion.ofFish("zulm dump --stream cursorI"), testing::StartsWith("cursorImage\t"));
}

} // namespace
} // namespace ZULMetaData::Test
