#pragma once

#include <array>
#include <csignal>
#include <cstddef>

namespace Zulm {

/// Signals that end a program unless it handles them, and that reach it from outside: from a terminal, another program,
/// a timer or a limit.
inline constexpr std::array s_endingSignals{SIGHUP,  SIGINT,  SIGQUIT, SIGPIPE,   SIGALRM, SIGTERM,
                                            SIGUSR1, SIGUSR2, SIGXCPU, SIGVTALRM, SIGPROF, SIGIO};

/// Sets the handler of all of them, except of those that the program was started to ignore or that another part of it
/// handles, such as the library that fuzzes the commands.
inline void handleEndingSignals(void (*handler)(int)) {
    static std::array<bool, s_endingSignals.size()> isHandledHere{};
    for (std::size_t i = 0; i < s_endingSignals.size(); ++i) {
        const auto previous = std::signal(s_endingSignals[i], handler);
        if (previous != SIG_DFL && !isHandledHere[i])
            std::signal(s_endingSignals[i], previous);
        else
            isHandledHere[i] = handler != SIG_DFL;
    }
}

} // namespace Zulm
