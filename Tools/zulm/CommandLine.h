#pragma once

// The command line as a whole: the commands in their groups, the options of all of them, their help.

#include "Tools/zulm/Command.h"

namespace Zulm {

/// Parses the command line and runs what it asks for. Whatever goes wrong ends in a message and an exit code.
ExitCode runCommandLine(int argc, char** argv);

} // namespace Zulm
