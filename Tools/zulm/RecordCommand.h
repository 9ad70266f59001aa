#pragma once

#include "Tools/zulm/Command.h"

#include <string>
#include <vector>

namespace Zulm {

/// Becomes the recorder, which is a program of its own and reads these words itself. Returns only if it cannot be
/// started.
ExitCode becomeRecorder(const std::vector<std::string>& words);

} // namespace Zulm
