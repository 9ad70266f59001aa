#pragma once

// The command line as a whole: the commands in their groups, the options of all of them, their help.

#include "Tools/zulm/Command.h"

#include <vector>

namespace Zulm {

/// Commands that the help shows under one heading, by the functions that add them.
struct CommandGroup {
    const char* heading;
    std::vector<void (*)(CLI::App& app, Action& chosen)> commands;
};

/// Does what `runCommandLine` does with these commands alone.
ExitCode runCommandLine(const std::vector<CommandGroup>& groups, int argc, char** argv);

/// Parses the command line and runs what it asks for. Whatever goes wrong ends in a message and an exit code.
ExitCode runCommandLine(int argc, char** argv);

} // namespace Zulm
