#pragma once

// The command line as a whole: the commands in their groups, the options of all of them, their help.

#include "Tools/zulm/Command.h"

#include <vector>

namespace Zulm {

/// Commands that the help shows under one heading.
struct CommandGroup {
    const char* heading;
    std::vector<void (*)(CLI::App& app, Action& chosen)> commands;
};

/// Parses the command line and runs what it asks for. Whatever goes wrong ends in a message and an exit code.
ExitCode runCommandLine(int argc, char** argv, const std::vector<CommandGroup>& groups);

} // namespace Zulm
