#include "Tools/zulm/SisterProgram.h"

#include "Tools/record/Options.h"
#include "Tools/render/Options.h"
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
#include <utility>

namespace Zulm {

namespace {

namespace fs = std::filesystem;

constexpr std::array s_sisters{SisterProgram{s_recordCommand, "zulm-record", "record", false},
                               SisterProgram{s_renderCommand, "zulm-render", "render", true},
                               SisterProgram{s_guideCommand, "zulm-render", "render", true}};

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

/// Refuses a command that is not the first word. `given` takes its options, which only the other program reads.
template <class Given>
void refuseLater(CLI::App& command, Action& chosen, std::shared_ptr<Given> given) {
    command.callback([name = command.get_name(), given = std::move(given), &chosen] {
        chosen = [name] {
            complain(fmt::format("'{0}' must be the first word, as in 'zulm {0} --help'", name));
            return ExitUsage;
        };
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
    const auto given = std::make_shared<Recorder::GivenOptions>();
    CLI::App* command = app.add_subcommand(s_recordCommand, Recorder::s_aboutRecording);
    Recorder::addRecordingOptions(*command, *given);
    command->footer(Recorder::s_recordingExamples);
    refuseLater(*command, chosen, given);
}

void addRenderCommand(CLI::App& app, Action& chosen) {
    const auto given = std::make_shared<Render::RenderOptions>();
    refuseLater(*Render::addRenderOptions(app, *given), chosen, given);
}

void addGuideCommand(CLI::App& app, Action& chosen) {
    const auto given = std::make_shared<Render::GuideOptions>();
    refuseLater(*Render::addGuideOptions(app, *given), chosen, given);
}

} // namespace Zulm
