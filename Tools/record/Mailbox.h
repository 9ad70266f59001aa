#pragma once

// What the camera's threads report to the thread that observes.

#include "Tools/record/FileHandle.h"
#include "Tools/record/Geometry.h"
#include "Tools/record/Instant.h"

#include <sys/eventfd.h>

#include <cstdint>
#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace Recorder {

class Mailbox {
public:
    struct Sight {
        Instant instant;
        Position pointer;
    };
    struct Mail {
        std::optional<Instant> started;
        std::vector<Sight> sights;
        std::string failure; ///< why the movie cannot go on
    };

    Mailbox() : wake_(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {}

    int descriptor() const { return wake_.get(); }

    template <class Change>
    void post(Change change) {
        {
            const std::lock_guard lock(mutex_);
            change(mail_);
        }
        const std::uint64_t one = 1;
        [[maybe_unused]] const auto written = ::write(wake_.get(), &one, sizeof(one));
    }

    Mail take() {
        std::uint64_t count = 0;
        [[maybe_unused]] const auto read = ::read(wake_.get(), &count, sizeof(count));
        const std::lock_guard lock(mutex_);
        return std::exchange(mail_, {});
    }

private:
    FileHandle wake_;
    std::mutex mutex_;
    Mail mail_;
};

} // namespace Recorder
