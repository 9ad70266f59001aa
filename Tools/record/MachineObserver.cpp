#include "Tools/record/MachineObserver.h"

#include "Platform/ProcessInfo.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <fstream>
#include <string>

namespace Recorder {

using namespace ZULMetaData;

namespace {

constexpr double s_usualDotsPerInch = 96;
constexpr Instant s_firstUsage = s_second / 4; ///< after the start; a short recording has one too

} // namespace

MachineObserver::MachineObserver(const XConnection& connection, Journal& journal)
    : journal_(journal), last_(readTicks()) {
    const Instant instant = now();
    journal_.note<ScaleFactorKind>(instant, scaleOf(connection));
    journal_.note<SystemDataKind>(instant, SystemDataMetaDataWriter::systemTexts(ProcessInfo::current()));
    next_ = instant + s_firstUsage;
}

MachineObserver::Ticks MachineObserver::readTicks() {
    std::ifstream file("/proc/stat");
    std::string word;
    Ticks ticks;
    if (!(file >> word) || word != "cpu")
        return ticks;
    constexpr int idle = 3;
    constexpr int waiting = 4;
    constexpr int steal = 7;
    std::uint64_t value = 0;
    for (int i = 0; i <= steal && file >> value; ++i) {
        ticks.all += value;
        if (i != idle && i != waiting)
            ticks.busy += value;
    }
    return ticks;
}

void MachineObserver::poll() {
    const Instant instant = now();
    if (instant < next_)
        return;
    next_ = std::max(next_ + s_second, instant);
    const Ticks ticks = readTicks();
    if (ticks.all > last_.all) {
        // A processor that is taken out takes its ticks with it.
        const std::uint64_t busy = std::min(std::max(ticks.busy, last_.busy) - last_.busy, ticks.all - last_.all);
        journal_.note<CPUUsageKind>(instant,
                                    100 * static_cast<float>(busy) / static_cast<float>(ticks.all - last_.all));
    }
    last_ = ticks;
}

std::int32_t scaleOf(const XConnection& connection) {
    const std::string resources = connection.text(connection.root(), XCB_ATOM_RESOURCE_MANAGER).value_or("");
    const std::string name = "Xft.dpi:";
    for (std::size_t start = 0; start < resources.size();) {
        const std::size_t end = std::min(resources.find('\n', start), resources.size());
        if (resources.compare(start, name.size(), name) == 0) {
            const double dots = std::strtod(resources.c_str() + start + name.size(), nullptr);
            if (!(dots > 0)) // nor a number at all
                return 1;
            return std::max(1, static_cast<std::int32_t>(std::lround(std::min(dots, 9600.0) / s_usualDotsPerInch)));
        }
        start = end + 1;
    }
    return 1;
}

} // namespace Recorder
