#pragma once

#include "Tools/record/FileHandle.h"

#include <filesystem>
#include <optional>

namespace Recorder {

/// Takes SIGINT, SIGTERM, SIGHUP and SIGUSR1 as descriptors are taken, for all threads that are started later.
class StopSignals {
public:
    StopSignals();

    struct Signal {
        int number;
        bool isFromTerminal; ///< a key made it
    };

    int descriptor() const { return handle_.get(); }

    /// Returns the next signal that has arrived.
    std::optional<Signal> next();

    /// Ends the process, and the name of the folder is the last that it says.
    [[noreturn]] static void endAtOnce(int number, const std::filesystem::path& folder);

    /// From now on a signal ends the process at once, and the name of the folder is the last that it says.
    void endAtNext(const std::filesystem::path& folder);

private:
    FileHandle handle_;
};

} // namespace Recorder
