#pragma once

// Signals that end the program, noticed where it can clean up.

namespace Zulm {

/// A signal that ends the program.
struct Interruption {
    int signal;
};

/// While it lives, a signal that would end the program is only noted. Afterwards signals remove temporary files and end
/// the program.
class NotedSignals {
public:
    NotedSignals();
    ~NotedSignals();
    NotedSignals(const NotedSignals&) = delete;
    NotedSignals& operator=(const NotedSignals&) = delete;

    /// Throws `Interruption` if one has come.
    static void check();
};

/// Ends the program as the signal would have ended it. Call it when nothing is left to clean up.
[[noreturn]] void endBy(const Interruption& interruption);

} // namespace Zulm
