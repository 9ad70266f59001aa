#pragma once

// Times what a user does beside a raw baseline, in turn and in the same run: absolute times mean nothing on a shared
// machine. Prints a row of a Markdown table for each.

#include <functional>
#include <string>
#include <vector>

namespace ZULMetaData::Bench {

/// What is measured, against what, and the most that it may be.
struct Measure {
    std::string task;
    std::string baseline;
    double target = 0;
};

/// Work to be timed: `prepare` comes before every round and is not timed.
struct Work {
    std::function<void()> run;
    std::function<void()> prepare = [] {};
};

/// How often one of them takes the other's time, and what of it one unit takes.
struct Timing {
    double ratio = 0;
    double baseline = 0; ///< nanoseconds a unit
    double library = 0;  ///< nanoseconds a unit
};

/// Medians of interleaved rounds; the ratio is the median of the rounds' own.
Timing timeSideBySide(const Work& baseline, const Work& library, double units);

/// Measures and prints the row of a ratio. If the result is wrong, the row says so and tells no time.
void compare(const Measure& measure, const Work& baseline, const Work& library, double units,
             const std::function<bool()>& isRight);

/// Prints the row of any other figure.
void reportFigure(const Measure& measure, double figure, const std::string& unit);

/// Prints the row of a wrong result.
void reportWrong(const Measure& measure);

/// Runs the program. If there is an argument, it measures only tasks that contain this text. Returns 1 if a target was
/// missed by more than a tenth, or if a result was wrong.
int runBenchmarks(int argc, char** argv, const std::function<void()>& all);

/// Returns whether a task was asked for. `compare` checks it already.
bool isSelected(const Measure& measure);

/// Returns a folder for the files of this run, in memory if the machine has a folder for that. It is removed at the
/// end.
const std::string& scratchFolder();

double median(std::vector<double> values);

} // namespace ZULMetaData::Bench
