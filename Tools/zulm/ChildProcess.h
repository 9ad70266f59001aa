#pragma once

// Runs another program and waits for it.

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace Zulm {

struct ChildResult {
    int exitCode = 0;   ///< 128 + n if signal n ended it
    std::string errors; ///< the beginning of what it wrote on standard error
};

/// Runs a program that is searched for in PATH, without a shell. It finds `input` on standard input. Calls `take` with
/// what it writes on standard output, as it comes. If a signal is noted meanwhile (see `NotedSignals`) or `take`
/// throws, the program is killed first. Throws `Failure` if it cannot be started.
ChildResult runChild(const std::vector<std::string>& words, const std::function<void(std::string_view bytes)>& take,
                     std::string_view input = {});

/// Returns a function that calls `take` with each line of the bytes that it is called with.
std::function<void(std::string_view bytes)> inLines(std::function<void(std::string_view line)> take);

} // namespace Zulm
