#pragma once

// The standard streams of the process: what is printed is counted as done only when it has been taken.

#include <string>
#include <string_view>

namespace Zulm {

/// Puts something harmless in place of standard streams that are closed, so that no file that is opened later takes
/// their number and gets what is printed. Call first.
void secureStandardStreams();

/// Writes to standard output, buffered. Throws `std::system_error` where it is not taken, as `fmt::print` does.
void writeOutput(std::string_view bytes);

/// Sends what is buffered for standard output. False, after a complaint, where it could not be written.
bool flushStandardOutput();

/// Says that `error` kept standard output from being written, but not if its reader has ended: `zulm dump | head` is no
/// failure that a person wants to hear of.
void complainAboutOutput(int error);

/// `text` in bold where standard output may be coloured.
std::string heading(const std::string& text);

} // namespace Zulm
