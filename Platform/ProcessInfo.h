#pragma once

// The machine and the operating system on which this process runs.

#include "../SharedDependencies/Export.h"

#include <cstdint>
#include <string>

namespace ZULMetaData {

/// The facts about the machine that a recording stores.
struct ZULMETADATA_API ProcessInfo {
    /// The number of processors of the machine; at least 1.
    std::uint64_t processorCount = 1;
    /// The number of processors that are switched on; from 1 to `processorCount`.
    std::uint64_t activeProcessorCount = 1;
    /// The size of the memory in bytes; 0 if the system does not say.
    std::uint64_t physicalMemory = 0;
    /// A text for people: "Version 14.2 (Build 23C64)" on a Mac, the name of the distribution on Linux.
    std::string operatingSystemVersionString;
    /// The version of the system on a Mac, of the kernel on Linux. A part that the version does not have is 0.
    struct {
        std::int64_t major = 0, minor = 0, patch = 0;
    } operatingSystemVersion;

    /// Returns the current facts; asks the system at every call.
    static ProcessInfo current();
};

} // namespace ZULMetaData
