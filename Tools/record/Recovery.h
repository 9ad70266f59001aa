#pragma once

#include <filesystem>

namespace Recorder {

/// Makes a movie of what a recorder left in `folder` when it was killed. An empty `output` is where the recording would
/// have gone. Returns how the program ends; throws `Failure` if nothing can be made.
int recover(const std::filesystem::path& folder, const std::filesystem::path& output, bool deletesFolder);

} // namespace Recorder
