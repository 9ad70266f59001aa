#pragma once

// The machine and the operating system that this process runs on.

#include "../SharedDependencies/Export.h"

#include <cstdint>
#include <string>

namespace ZULMetaData {

/// What a recording tells of its machine.
struct ZULMETADATA_API ProcessInfo {
    /// Processors that the machine has; never 0.
    std::uint64_t processorCount = 1;
    /// Processors that are switched on; at least 1, at most processorCount.
    std::uint64_t activeProcessorCount = 1;
    /// In bytes; 0 where the system does not tell.
    std::uint64_t physicalMemory = 0;
    /// For people: "Version 14.2 (Build 23C64)" on a Mac, the name of the distribution on Linux.
    std::string operatingSystemVersionString;
    /// The system's release on a Mac, the kernel's on Linux; a part that it does not have is 0.
    struct {
        std::int64_t major = 0, minor = 0, patch = 0;
    } operatingSystemVersion;

    /// Asks the system anew at every call.
    static ProcessInfo current();
};

} // namespace ZULMetaData
