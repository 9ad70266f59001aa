#include "Tools/zulm/TemporaryFile.h"

#include "Tools/zulm/EndingSignals.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <system_error>
#include <unistd.h>

namespace Zulm {

namespace {

/// What a signal must remove: a handler can neither lock nor allocate.
struct Slot {
    volatile std::sig_atomic_t isUsed = 0;
    std::array<char, 4096> path{};
};

std::array<Slot, 4> s_slots;

extern "C" void removeTemporariesAndEnd(int signal) {
    removeTemporaryFiles();
    std::signal(signal, SIG_DFL);
    std::raise(signal);
}

/// The pattern that `mkstemps` fills in, with a short name instead of one that would be too long for a file system.
std::string namePattern(const std::string& name, const std::string& suffix) {
    constexpr std::size_t longestName = 255; // in bytes
    const std::string pattern = fmt::format(".{}.XXXXXX{}", name, suffix);
    return pattern.size() <= longestName ? pattern : fmt::format(".zulm.XXXXXX{}", suffix);
}

void remember(const std::string& path) {
    const auto slot =
        std::find_if(s_slots.begin(), s_slots.end(), [](const Slot& candidate) { return !candidate.isUsed; });
    if (slot == s_slots.end() || path.size() >= slot->path.size())
        return;
    std::memcpy(slot->path.data(), path.c_str(), path.size() + 1);
    slot->isUsed = 1;
    removeTemporaryFilesOnSignals();
}

void forget(const std::string& path) {
    for (Slot& slot : s_slots)
        if (slot.isUsed && path == slot.path.data())
            slot.isUsed = 0;
}

} // namespace

TemporaryFile::TemporaryFile(const std::string& folder, const std::string& name, const std::string& extension) {
    constexpr std::size_t longestExtension = 16; // no container has a longer one
    const std::string suffix = extension.size() <= longestExtension ? extension : "";
    path_ = (std::filesystem::path(folder) / namePattern(name, suffix)).string();
    const int file = mkstemps(path_.data(), static_cast<int>(suffix.size()));
    if (file < 0)
        throw std::system_error(errno, std::generic_category(), path_);
    close(file);
    remember(path_);
}

TemporaryFile::~TemporaryFile() {
    if (!isReleased_ && unlink(path_.c_str()) != 0)
        unlink(path_.c_str()); // a disk may refuse once
    forget(path_);
}

void TemporaryFile::release() {
    isReleased_ = true;
    forget(path_);
}

void removeTemporaryFilesOnSignals() {
    handleEndingSignals(removeTemporariesAndEnd);
}

void removeTemporaryFiles() noexcept {
    for (const Slot& slot : s_slots)
        if (slot.isUsed)
            unlink(slot.path.data());
}

} // namespace Zulm
