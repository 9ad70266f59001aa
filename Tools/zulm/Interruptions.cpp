#include "Tools/zulm/Interruptions.h"

#include "Tools/zulm/EndingSignals.h"
#include "Tools/zulm/TemporaryFile.h"

#include <csignal>
#include <cstdlib>

namespace Zulm {

namespace {

volatile std::sig_atomic_t s_noted = 0;

extern "C" void noteEndingSignal(int signal) {
    s_noted = signal;
}

} // namespace

NotedSignals::NotedSignals() {
    s_noted = 0;
    handleEndingSignals(noteEndingSignal);
}

NotedSignals::~NotedSignals() {
    removeTemporaryFilesOnSignals();
}

void NotedSignals::check() {
    if (s_noted != 0)
        throw Interruption{s_noted};
}

void endBy(const Interruption& interruption) {
    removeTemporaryFiles();
    std::signal(interruption.signal, SIG_DFL);
    std::raise(interruption.signal);
    std::abort(); // the signal is blocked
}

} // namespace Zulm
