#include "Platform/ProcessInfo.h"

#include "Platform/OSRelease.h"

#include <algorithm>

#if defined(__APPLE__)
#include <sys/sysctl.h>
#include <sys/types.h>
#else
#include <sys/utsname.h>
#include <unistd.h>

#include <fstream>
#include <sstream>
#endif

namespace ZULMetaData {

namespace {

#if defined(__APPLE__)

template <class Number>
std::uint64_t systemNumber(const char* name) {
    Number value = 0;
    std::size_t size = sizeof value;
    const bool known = sysctlbyname(name, &value, &size, nullptr, 0) == 0 && size == sizeof value && value > 0;
    return known ? static_cast<std::uint64_t>(value) : 0;
}

std::string systemText(const char* name) {
    char text[256] = {};
    std::size_t size = sizeof text - 1;
    return sysctlbyname(name, text, &size, nullptr, 0) == 0 ? std::string(text) : std::string();
}

/// Returns what the system says. A number that it does not say is 0.
ProcessInfo factsOfSystem() {
    const std::string release = systemText("kern.osproductversion");
    ProcessInfo info;
    info.processorCount = systemNumber<std::int32_t>("hw.logicalcpu_max");
    info.activeProcessorCount = systemNumber<std::int32_t>("hw.activecpu");
    info.physicalMemory = systemNumber<std::int64_t>("hw.memsize");
    info.operatingSystemVersionString = "Version " + release + " (Build " + systemText("kern.osversion") + ")";
    info.operatingSystemVersion = parseReleaseNumbers(release);
    return info;
}

#else

std::uint64_t systemNumber(int name) {
    const long value = sysconf(name);
    return value > 0 ? static_cast<std::uint64_t>(value) : 0;
}

std::string contentsOf(const char* path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream contents;
    contents << file.rdbuf();
    return contents.str();
}

std::string nameOfDistribution() {
    for (const char* path : {"/etc/os-release", "/usr/lib/os-release"})
        if (auto name = prettyNameOfOSRelease(contentsOf(path)); !name.empty())
            return name;
    return {};
}

/// Returns what the system says. A number that it does not say is 0.
ProcessInfo factsOfSystem() {
    utsname kernel{};
    if (uname(&kernel) != 0)
        kernel = {};
    ProcessInfo info;
    info.processorCount = systemNumber(_SC_NPROCESSORS_CONF);
    info.activeProcessorCount = systemNumber(_SC_NPROCESSORS_ONLN);
    info.physicalMemory = systemNumber(_SC_PHYS_PAGES) * systemNumber(_SC_PAGESIZE);
    info.operatingSystemVersionString = nameOfDistribution();
    if (info.operatingSystemVersionString.empty())
        info.operatingSystemVersionString = std::string(kernel.sysname) + " " + kernel.release;
    info.operatingSystemVersion = parseReleaseNumbers(kernel.release);
    return info;
}

#endif

} // namespace

ProcessInfo ProcessInfo::current() {
    ProcessInfo info = factsOfSystem();
    info.activeProcessorCount = std::max<std::uint64_t>(info.activeProcessorCount, 1);
    info.processorCount = std::max(info.processorCount, info.activeProcessorCount);
    return info;
}

} // namespace ZULMetaData
