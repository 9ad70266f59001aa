#include "Benchmarks/Runner.h"

#include <fmt/core.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <filesystem>

namespace ZULMetaData::Bench {

namespace {

constexpr int s_rounds = 9;
bool s_isMissed = false;
std::string s_filter;

double nanosecondsOf(const Work& work) {
    work.prepare();
    const auto start = std::chrono::steady_clock::now();
    work.run();
    return std::chrono::duration<double, std::nano>(std::chrono::steady_clock::now() - start).count();
}

struct Folder {
    std::string path;

    Folder() {
        const auto parent = std::filesystem::exists("/dev/shm") ? "/dev/shm" : std::filesystem::temp_directory_path();
        std::string pattern = (parent / "zulm-bench-XXXXXX").string();
        path = mkdtemp(pattern.data()) ? pattern : ".";
    }
    ~Folder() {
        std::error_code ignored;
        std::filesystem::remove_all(path, ignored);
    }
};

void printRow(const Measure& measure, const std::string& figure, const std::string& target, bool isMet) {
    fmt::print("| {} | {} | {} | {} | {} |\n", measure.task, measure.baseline, figure, target,
               isMet ? "met" : "**missed**");
    std::fflush(stdout);
    s_isMissed = s_isMissed || !isMet;
}

bool isMet(const Measure& measure, double figure) {
    return figure <= measure.target * 1.1;
}

} // namespace

double median(std::vector<double> values) {
    const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
    std::nth_element(values.begin(), middle, values.end());
    return *middle;
}

Timing timeSideBySide(const Work& baseline, const Work& library, double units) {
    std::vector<double> ratios;
    std::vector<double> baselines;
    std::vector<double> libraries;
    for (int round = 0; round < s_rounds; ++round) {
        baselines.push_back(nanosecondsOf(baseline));
        libraries.push_back(nanosecondsOf(library));
        ratios.push_back(libraries.back() / baselines.back());
    }
    return {median(ratios), median(baselines) / units, median(libraries) / units};
}

void compare(const Measure& measure, const Work& baseline, const Work& library, double units,
             const std::function<bool()>& isRight) {
    if (!isSelected(measure))
        return;
    const Timing timing = timeSideBySide(baseline, library, units);
    if (!isRight())
        return reportWrong(measure);
    printRow(measure, fmt::format("{:.2f}x ({:.1f} ns : {:.1f} ns)", timing.ratio, timing.library, timing.baseline),
             fmt::format("{:.2f}x", measure.target), isMet(measure, timing.ratio));
}

void reportFigure(const Measure& measure, double figure, const std::string& unit) {
    printRow(measure, fmt::format("{:.3g} {}", figure, unit), fmt::format("{:g} {}", measure.target, unit),
             isMet(measure, figure));
}

void reportWrong(const Measure& measure) {
    printRow(measure, "wrong result", "-", false);
}

int runBenchmarks(int argc, char** argv, const std::function<void()>& all) {
    s_filter = argc > 1 ? argv[1] : "";
    all();
    return s_isMissed ? 1 : 0;
}

bool isSelected(const Measure& measure) {
    return measure.task.find(s_filter) != std::string::npos;
}

const std::string& scratchFolder() {
    static const Folder folder;
    return folder.path;
}

} // namespace ZULMetaData::Bench
