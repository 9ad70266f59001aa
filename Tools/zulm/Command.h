#pragma once

// What the commands of `zulm` share: how they are added, how they end, and how they fail.

#include "Tools/zulm/Failure.h"

#include <CLI/CLI.hpp>

#include <functional>
#include <string>
#include <vector>

namespace Zulm {

enum ExitCode : int {
    ExitFine = 0,
    ExitFailed = 1,
    ExitUsage = 2,
    ExitDamaged = 3,    ///< done, but something is lost or damaged
    ExitNoMetaData = 4, ///< readable, but without recording metadata
};

/// Set by the command that was chosen, run after all options are read.
using Action = std::function<ExitCode()>;

void addInfoCommand(CLI::App& app, Action& chosen);
void addAtomsCommand(CLI::App& app, Action& chosen);
void addDumpCommand(CLI::App& app, Action& chosen);
void addInsightsCommand(CLI::App& app, Action& chosen);
void addDiffCommand(CLI::App& app, Action& chosen);
void addGrepCommand(CLI::App& app, Action& chosen);
void addStateCommand(CLI::App& app, Action& chosen);
void addViewCommand(CLI::App& app, Action& chosen);
void addVerifyCommand(CLI::App& app, Action& chosen);
void addAttachCommand(CLI::App& app, Action& chosen);
void addRepairCommand(CLI::App& app, Action& chosen);
void addStampCommand(CLI::App& app, Action& chosen);
void addCompactCommand(CLI::App& app, Action& chosen);
void addDetachCommand(CLI::App& app, Action& chosen);
void addCutCommand(CLI::App& app, Action& chosen);
void addRetimeCommand(CLI::App& app, Action& chosen);
void addRedactCommand(CLI::App& app, Action& chosen);
void addExtractCommand(CLI::App& app, Action& chosen);
void addSalvageCommand(CLI::App& app, Action& chosen);
void addExportCommand(CLI::App& app, Action& chosen);
void addConvertCommand(CLI::App& app, Action& chosen);
void addDemoCommand(CLI::App& app, Action& chosen);
void addRecordCommand(CLI::App& app, Action& chosen);
void addRenderCommand(CLI::App& app, Action& chosen);
void addGuideCommand(CLI::App& app, Action& chosen);

/// One line on standard error, whatever the settings.
void complain(const std::string& message);

/// The same for what a person should know though the work could be done. Not with --quiet.
void warn(const std::string& message);

/// A warning about a file whose sentence holds escapes already: "FILE: SENTENCE".
void warnAbout(const std::string& file, const std::string& shownSentence);

/// The same for what is being done. Only with --verbose.
void say(const std::string& message);

/// The worse of two ends, for a command that works on several files.
ExitCode worseOf(ExitCode left, ExitCode right);

/// Runs `work`. A `Failure` or another exception becomes a complaint and `ExitFailed`. Throws only a
/// `std::system_error` that names no file, which standard output throws if it cannot be written.
ExitCode orComplaint(const Action& work);

/// Runs `work` on one file after the other, whatever happens to the ones before. A `Failure` becomes a complaint.
/// Returns the worst end.
ExitCode forEachFile(const std::vector<std::string>& files, const std::function<ExitCode(const std::string&)>& work);

/// Fails unless `path` is a regular file that can be opened; `forWriting` asks for that too.
void requireFile(const std::string& path, bool forWriting = false);

} // namespace Zulm
