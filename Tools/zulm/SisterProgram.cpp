#include "Tools/zulm/SisterProgram.h"

#include "Tools/record/Options.h"
#include "Tools/zulm/Manual.h"

#include <fmt/core.h>

#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <system_error>

namespace Zulm {

namespace {

namespace fs = std::filesystem;

constexpr std::array s_sisters{
    SisterProgram{s_recordCommand, "zulm-record", "record", "", false},
    SisterProgram{"render", "zulm-render", "render",
                  "Make a film of a recording, with its cursor drawn in ('zulm render --help')", true},
    SisterProgram{"guide", "zulm-render", "render",
                  "Make a guide of a recording, a step for each click ('zulm guide --help')", true}};

/// The places of a program: beside this one, where both were built, and where the shell looks for programs.
std::vector<std::string> pathsOf(const SisterProgram& sister) {
    std::vector<std::string> paths;
    std::error_code error;
    const fs::path own = fs::read_symlink("/proc/self/exe", error);
    if (!error)
        paths = {(own.parent_path() / sister.program).string(),
                 (own.parent_path().parent_path() / sister.folder / sister.program).string()};
    paths.emplace_back(sister.program);
    return paths;
}

void addSister(CLI::App& app, Action& chosen, std::string_view name) {
    const SisterProgram& sister = *sisterProgramOf(name);
    CLI::App* command = app.add_subcommand(std::string(name), sister.description);
    command->allow_extras();
    command->callback([command, &chosen, &sister] {
        chosen = [words = command->remaining(), &sister] { return become(sister, words); };
    });
}

} // namespace

const SisterProgram* sisterProgramOf(std::string_view command) {
    const auto found = std::find_if(s_sisters.begin(), s_sisters.end(),
                                    [command](const SisterProgram& sister) { return sister.command == command; });
    return found == s_sisters.end() ? nullptr : &*found;
}

ExitCode become(const SisterProgram& sister, const std::vector<std::string>& words) {
    std::vector<std::string> copies{sister.program};
    if (sister.takesCommand)
        copies.emplace_back(sister.command);
    copies.insert(copies.end(), words.begin(), words.end());
    std::vector<char*> arguments;
    arguments.reserve(copies.size() + 1);
    for (std::string& word : copies)
        arguments.push_back(word.data());
    arguments.push_back(nullptr);
    int error = ENOENT;
    for (const std::string& path : pathsOf(sister)) {
        execvp(path.c_str(), arguments.data());
        error = errno == ENOENT ? error : errno;
    }
    complain(fmt::format("{}: cannot be started: {}; it is a program of its own, which the package {} installs",
                         sister.program, std::strerror(error), sister.program));
    return ExitFailed;
}

void addRecordCommand(CLI::App& app, Action& chosen) {
    const auto given = std::make_shared<Recorder::GivenOptions>(); // which nobody reads: the recorder does
    CLI::App* command = app.add_subcommand(s_recordCommand, Recorder::s_aboutRecording);
    Recorder::addRecordingOptions(*command, *given);
    command->footer(Recorder::s_recordingExamples);
    command->callback([given, &chosen] {
        chosen = [] {
            complain("'record' must be the first word, as in 'zulm record --help'");
            return ExitUsage;
        };
    });
}

void addRenderCommand(CLI::App& app, Action& chosen) {
    addSister(app, chosen, "render");
}

void addGuideCommand(CLI::App& app, Action& chosen) {
    addSister(app, chosen, "guide");
}

} // namespace Zulm
