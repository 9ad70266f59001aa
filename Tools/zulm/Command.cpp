#include "Tools/zulm/Command.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>

namespace Zulm {

void complain(const std::string& message) {
    fmt::print(stderr, "zulm: {}\n", message);
}

ExitCode worseOf(ExitCode left, ExitCode right) {
    constexpr std::array fromBestToWorst{ExitFine, ExitNoMetaData, ExitDamaged, ExitUsage, ExitFailed};
    const auto rank = [&](ExitCode code) { return std::ranges::find(fromBestToWorst, code); };
    return rank(left) < rank(right) ? right : left;
}

void requireFile(const std::string& path, bool forWriting) {
    std::error_code error;
    const auto status = std::filesystem::status(path, error);
    if (status.type() == std::filesystem::file_type::not_found)
        throw Failure(fmt::format("{}: no such file", path));
    if (error)
        throw Failure(fmt::format("{}: {}", path, error.message()));
    if (!std::filesystem::is_regular_file(status))
        throw Failure(fmt::format("{}: not a regular file", path));
    errno = 0;
    const auto mode = forWriting ? std::ios::in | std::ios::out : std::ios::in;
    if (!std::fstream(path, mode | std::ios::binary).is_open())
        throw Failure(fmt::format("{}: cannot be opened: {}", path, std::strerror(errno)));
}

} // namespace Zulm
