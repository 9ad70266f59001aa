#pragma once

// The process that asks the accessibility bus. It may hang or die: then nothing is known of the focus.

#include "Tools/record/FileHandle.h"
#include "Tools/record/Geometry.h"
#include "Tools/record/Instant.h"
#include "Tools/record/PrivacyFilter.h"

#include <sys/types.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

namespace Recorder {

/// What the process reports.
struct AccessibilityEvents {
    std::function<void(std::uint32_t process, Focus focus)> focus; ///< of an application has changed
    /// To a question about the focus. There is nothing if the application did not answer in time.
    std::function<void(Instant asked, std::optional<Focus> focus)> answer;
    std::function<void(const std::optional<Area>& area)> hover; ///< what the pointer is over, if the bus knows
};

class AccessibilityProcess {
public:
    /// Starts the process for a display.
    explicit AccessibilityProcess(const std::string& display);
    ~AccessibilityProcess();
    AccessibilityProcess(const AccessibilityProcess&) = delete;
    AccessibilityProcess& operator=(const AccessibilityProcess&) = delete;

    /// Waits for the process to reach the bus, or to end because there is none.
    void waitUntilReady(Instant until);

    /// Returns whether the process has reached the bus.
    bool isReady() const { return isReady_; }

    /// Returns whether the process has ended because there is no bus.
    bool isAbsent() const { return isAbsent_; }

    int descriptor() const { return output_.get(); }
    bool isAlive() const { return static_cast<bool>(output_); }

    /// Takes what has arrived. Ends the process if it hangs.
    void serve(const AccessibilityEvents& events);

    /// Another window is on top, which the next questions are about.
    void windowChanged(std::uint32_t process);

    /// Asks for the focus of the window on top, unless such a question waits for its answer or is younger than
    /// `interval`: each one makes the applications work.
    void ask(Instant interval);

    /// Asks what the pointer hovers over. Returns false if such a question waits for its answer.
    bool askHover(Position pointer);

private:
    bool readLines(const std::function<void(const std::string&)>& take);
    void take(const std::string& line, const AccessibilityEvents& events);
    bool hangs() const;
    void send(const std::string& line);
    void end();

    pid_t process_ = -1;
    FileHandle input_;
    FileHandle output_;
    std::string pending_;
    std::uint64_t windows_ = 0;    ///< how many windows came to the top
    std::optional<Instant> asked_; ///< when the question was asked that waits
    Instant lastAsked_ = 0;
    std::uint64_t askedWindow_ = 0;
    std::optional<Instant> askedHover_;
    std::uint64_t hoverWindow_ = 0;
    bool isReady_ = false;
    bool isAbsent_ = false;
};

/// The child's side: asks the bus of the display that the environment names, until its input ends.
int watchAccessibility();

} // namespace Recorder
