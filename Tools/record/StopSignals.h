#pragma once

#include "Tools/record/FileHandle.h"
#include "Tools/record/Instant.h"

#include <deque>
#include <filesystem>
#include <mutex>
#include <optional>
#include <thread>

namespace Recorder {

/// Reports SIGINT, SIGTERM, SIGHUP and SIGUSR1 through a descriptor; threads that start later do not get them. The
/// second signal to end ends the process, even if the recorder waits for something that never comes.
class StopSignals {
public:
    StopSignals();
    ~StopSignals();
    StopSignals(const StopSignals&) = delete;
    StopSignals& operator=(const StopSignals&) = delete;

    struct Signal {
        int number;
        bool isFromTerminal; ///< a key made it
    };

    int descriptor() const { return arrived_.get(); }

    /// Returns the next signal that has arrived.
    std::optional<Signal> next();

    /// A process that is ended by a signal says the name of this folder last, unless it is empty.
    void nameFolder(const std::filesystem::path& folder);

    /// From now on the first signal to end ends the process.
    void endAtNext();

private:
    void watch();
    void take(const Signal& signal);
    [[noreturn]] void endProcess(int number) const;

    FileHandle signals_;
    FileHandle arrived_; ///< readable while there are signals to take
    FileHandle over_;    ///< readable when the thread is to end
    std::mutex mutex_;
    std::deque<Signal> queue_;
    std::filesystem::path folder_;
    bool endsAtNext_ = false;
    int lastEnd_ = 0; ///< the last signal to end
    Instant lastEndAt_ = 0;
    std::thread thread_;
};

} // namespace Recorder
