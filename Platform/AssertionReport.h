#pragma once

// The platform's own report of a failed assertion, raised directly: unlike `assert` it names the place that the
// caller passes, and it stays in release builds.

namespace ZULMetaData {

/// Prints the platform's assertion message to standard error and aborts the process.
[[noreturn]] void reportFailedAssertion(const char* expression, const char* function, const char* file,
                                        int line) noexcept;

} // namespace ZULMetaData
