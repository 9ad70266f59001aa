#pragma once

// The commands of `zulm`, all of them.

#include "Tools/zulm/CommandLine.h"

namespace Zulm {

/// In the order of the help.
std::vector<CommandGroup> commandGroups();

} // namespace Zulm
