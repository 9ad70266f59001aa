#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace Recorder {

/// What only the server's RECORD extension tells: keys that repeat, of which there are no raw events, and clients that
/// hide the cursor.
class TrafficObserver {
public:
    struct Events {
        std::function<void(std::uint32_t serverTime, std::uint8_t key)> keyRepeated;
        std::function<void(std::uint32_t serverTime, bool isHidden)> cursorHidden;
    };

    /// Without the extension nothing is told.
    TrafficObserver(const std::string& display, Events events);
    ~TrafficObserver();
    TrafficObserver(const TrafficObserver&) = delete;
    TrafficObserver& operator=(const TrafficObserver&) = delete;

    /// Returns the descriptor to wait for, -1 if there is none.
    int descriptor() const;

    /// Takes what has arrived.
    void serve();

private:
    struct State;
    std::unique_ptr<State> state_;
};

} // namespace Recorder
