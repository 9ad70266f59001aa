#pragma once

#include "Tools/zulm/Failure.h"

#include <fmt/core.h>

#include <string>
#include <system_error>

namespace Zulm {

/// Runs `work` on a file. A failure of the system becomes a `Failure` that names the file.
template <class Work>
auto onFile(const std::string& path, Work work) {
    try {
        return work();
    } catch (const std::system_error& error) {
        throw Failure(fmt::format("{}: {}", path, error.code().message()));
    }
}

} // namespace Zulm
