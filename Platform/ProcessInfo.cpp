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

std::uint64_t configuredProcessors() {
    return systemNumber<std::int32_t>("hw.logicalcpu_max");
}

std::uint64_t onlineProcessors() {
    return systemNumber<std::int32_t>("hw.activecpu");
}

std::uint64_t memorySize() {
    return systemNumber<std::int64_t>("hw.memsize");
}

std::string release() {
    return systemText("kern.osproductversion");
}

std::string versionText() {
    return "Version " + release() + " (Build " + systemText("kern.osversion") + ")";
}

#else

std::uint64_t systemNumber(int name) {
    const long value = sysconf(name);
    return value > 0 ? static_cast<std::uint64_t>(value) : 0;
}

std::uint64_t configuredProcessors() {
    return systemNumber(_SC_NPROCESSORS_CONF);
}

std::uint64_t onlineProcessors() {
    return systemNumber(_SC_NPROCESSORS_ONLN);
}

std::uint64_t memorySize() {
    return systemNumber(_SC_PHYS_PAGES) * systemNumber(_SC_PAGESIZE);
}

utsname kernelName() {
    utsname name{};
    if (uname(&name) != 0)
        return {};
    return name;
}

std::string release() {
    return kernelName().release;
}

std::string contentsOf(const char* path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream contents;
    contents << file.rdbuf();
    return contents.str();
}

std::string versionText() {
    for (const char* path : {"/etc/os-release", "/usr/lib/os-release"})
        if (auto name = prettyNameOfOSRelease(contentsOf(path)); !name.empty())
            return name;
    const utsname kernel = kernelName();
    return std::string(kernel.sysname) + " " + kernel.release;
}

#endif

} // namespace

ProcessInfo ProcessInfo::current() {
    ProcessInfo info;
    info.activeProcessorCount = std::max<std::uint64_t>(onlineProcessors(), 1);
    info.processorCount = std::max(configuredProcessors(), info.activeProcessorCount);
    info.physicalMemory = memorySize();
    info.operatingSystemVersionString = versionText();
    info.operatingSystemVersion = parseReleaseNumbers(release());
    return info;
}

} // namespace ZULMetaData
