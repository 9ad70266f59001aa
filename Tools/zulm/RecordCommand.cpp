#include "Tools/zulm/RecordCommand.h"

#include "Tools/record/Options.h"
#include "Tools/zulm/Command.h"
#include "Tools/zulm/Manual.h"

#include <fmt/core.h>

#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <string>
#include <system_error>
#include <vector>

namespace Zulm {

namespace {

namespace fs = std::filesystem;

constexpr auto s_recorder = "zulm-record";

/// The places of the recorder: beside this program, where both were built, and where the shell looks for programs.
std::vector<std::string> recorderPaths() {
    std::vector<std::string> paths;
    std::error_code error;
    const fs::path own = fs::read_symlink("/proc/self/exe", error);
    if (!error)
        paths = {(own.parent_path() / s_recorder).string(),
                 (own.parent_path().parent_path() / "record" / s_recorder).string()};
    paths.emplace_back(s_recorder);
    return paths;
}

} // namespace

ExitCode becomeRecorder(const std::vector<std::string>& words) {
    std::vector<std::string> copies = words;
    std::vector<char*> arguments;
    std::string name = s_recorder;
    arguments.push_back(name.data());
    for (std::string& word : copies)
        arguments.push_back(word.data());
    arguments.push_back(nullptr);
    int error = ENOENT;
    for (const std::string& path : recorderPaths()) {
        execvp(path.c_str(), arguments.data());
        error = errno == ENOENT ? error : errno;
    }
    complain(fmt::format("{}: cannot be started: {}; it is a program of its own, which the package {} installs",
                         s_recorder, std::strerror(error), s_recorder));
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

} // namespace Zulm
