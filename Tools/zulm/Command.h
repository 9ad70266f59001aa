#pragma once

// What the commands of `zulm` share: how they are added, how they end, and how they fail.

#include <CLI/CLI.hpp>

#include <functional>
#include <stdexcept>
#include <string>

namespace Zulm {

enum ExitCode : int {
    ExitFine = 0,
    ExitFailed = 1,
    ExitUsage = 2,
    ExitDamaged = 3,    ///< done, but something is lost or damaged
    ExitNoMetaData = 4, ///< readable, but without recording metadata
};

/// Why a command could not do its work, in words for a person.
class Failure : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Set by the command that was chosen, run after all options are read.
using Action = std::function<ExitCode()>;

void addInfoCommand(CLI::App& app, Action& chosen);
void addDumpCommand(CLI::App& app, Action& chosen);
void addAttachCommand(CLI::App& app, Action& chosen);
void addStampCommand(CLI::App& app, Action& chosen);

/// One line on standard error.
void complain(const std::string& message);

/// The worse of two ends, for a command that works on several files.
ExitCode worseOf(ExitCode left, ExitCode right);

/// Fails unless `path` is a regular file that can be opened; `forWriting` asks for that too.
void requireFile(const std::string& path, bool forWriting = false);

} // namespace Zulm
