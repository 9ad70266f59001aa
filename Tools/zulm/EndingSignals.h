#pragma once

#include <array>
#include <csignal>

namespace Zulm {

/// Signals that end a program unless it handles them, and that reach it from outside: from a terminal, another program,
/// a timer or a limit.
inline constexpr std::array s_endingSignals{SIGHUP,  SIGINT,  SIGQUIT, SIGPIPE,   SIGALRM, SIGTERM,
                                            SIGUSR1, SIGUSR2, SIGXCPU, SIGVTALRM, SIGPROF, SIGIO};

/// Sets the handler of all of them, except of those that the program was started to ignore.
inline void handleEndingSignals(void (*handler)(int)) {
    for (const int signal : s_endingSignals)
        if (std::signal(signal, handler) == SIG_IGN)
            std::signal(signal, SIG_IGN);
}

} // namespace Zulm
