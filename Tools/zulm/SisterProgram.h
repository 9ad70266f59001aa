#pragma once

#include "Tools/zulm/Command.h"

#include <string>
#include <string_view>
#include <vector>

namespace Zulm {

/// A command that is a program of its own, so that `zulm` needs none of its libraries. The program reads all of its
/// words itself, --help too; `zulm` knows its options for the manual and the completions.
struct SisterProgram {
    std::string_view command; ///< the word after `zulm`
    const char* program;      ///< its name
    const char* folder;       ///< of its sources, and of what is built of them
    bool takesCommand;        ///< whether its first word is the command, because it has several
};

/// Returns the program that this command starts, or null.
const SisterProgram* sisterProgramOf(std::string_view command);

/// Becomes the program. Returns only if it cannot be started.
ExitCode become(const SisterProgram& sister, const std::vector<std::string>& words);

} // namespace Zulm
