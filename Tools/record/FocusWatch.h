#pragma once

#include "Tools/record/AccessibilityProcess.h"
#include "Tools/record/PointerObserver.h"
#include "Tools/record/PrivacyFilter.h"
#include "Tools/record/WindowObserver.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>

namespace Recorder {

/// Follows which field has the focus, and what the pointer is over, with the accessibility bus if there is one. A
/// process that hangs or dies is started again; until it answers, the focus is not known.
class FocusWatch {
public:
    enum class Bus { Absent, Late, Ready };

    /// `tell` takes a sentence for the user.
    FocusWatch(std::string display, PrivacyFilter& privacy, std::function<void(const std::string&)> tell);

    /// Looks for the bus. From then on keys have to wait for it, unless it is absent.
    Bus reach(Instant until);

    /// Begins to follow the pointer. Both observers outlive the last call.
    void follow(WindowObserver& windows, const PointerObserver& pointer);

    /// Returns the descriptor to wait for, or a negative number.
    int descriptor() const { return process_ ? process_->descriptor() : -1; }

    /// Another window is on top.
    void windowChanged(Instant instant, std::uint32_t process);

    /// Looks what the pointer is over if it has moved.
    void hover();

    /// Takes what the bus has said, and asks for the focus as often as it is needed.
    void serve(bool hasWaitingKeys);

private:
    void start();
    void lost();
    void answered(Instant asked, std::optional<Focus> focus);
    void noteHover(const std::optional<Area>& area);

    std::string display_;
    PrivacyFilter& privacy_;
    std::function<void(const std::string&)> tell_;
    std::unique_ptr<AccessibilityProcess> process_;
    bool wasReady_ = false;
    std::optional<Instant> startAt_; ///< when the process is started again
    Instant pause_;                  ///< before it is
    Instant searchTook_ = 0;         ///< until the last answer came
    bool isBusy_ = false;            ///< the last answer was late
    Instant answersSince_ = 0;       ///< when the first answer came that was not, after one that was
    WindowObserver* windows_ = nullptr;
    const PointerObserver* pointer_ = nullptr;
    std::optional<Position> hovered_;
    bool wasDenied_ = false;
};

} // namespace Recorder
