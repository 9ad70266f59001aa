#include "Tools/record/Journal.h"

#include <chrono>

namespace Recorder {

using namespace ZULMetaData;

namespace {

/// Clicks and keys wait for 0.25 s before they come here, and all must be on the disk within 0.5 s.
constexpr std::chrono::milliseconds s_flushInterval(150);
constexpr double s_justBefore = 0.001; ///< seconds

} // namespace

Journal::Journal(const std::filesystem::path& folder, const std::function<void(const Error&)>& onLoss)
    : session_(folder, SessionOptions{s_flushInterval, onLoss, {}}) {}

template <class Kind>
void Journal::begin(Slot<Kind>& own, Instant zero) {
    const auto early = std::exchange(own.early, {});
    constexpr bool isEvent = Kind::role == StreamRole::Event;
    if constexpr (!isEvent) {
        const Noted<Kind>* before = nullptr;
        for (const auto& [instant, value] : early)
            if (instant <= zero)
                before = &value;
        if (before) {
            own.held = *before;
            write<Kind>(own, 0, *before);
        }
    }
    for (const auto& [instant, value] : early)
        if (instant > zero || (isEvent && instant == zero))
            note<Kind>(instant, value);
}

void Journal::start(Instant zero) {
    clock_.start(timeIn(zero));
    std::apply([&](auto&... slots) { (begin(slots, zero), ...); }, slots_);
    session_.flush();
}

void Journal::pause(Instant instant) {
    clock_.pause(timeIn(instant));
}

void Journal::resume(Instant instant) {
    clock_.resume(timeIn(instant));
    const auto writeChanged = [this, instant](auto& slot) {
        using Kind = typename std::remove_reference_t<decltype(slot)>::KindType;
        if constexpr (Kind::role == StreamRole::State)
            if (slot.held && (!slot.written || !isSameState(*slot.held, *slot.written))) {
                const double time = timeOf(instant);
                if (std::is_same_v<Kind, CursorLocationKind> && slot.written && slot.time < time - s_justBefore)
                    write<Kind>(slot, time - s_justBefore, Noted<Kind>(*slot.written)); // it rested until the pause
                write<Kind>(slot, time, *slot.held);
            }
    };
    std::apply([&](auto&... slots) { (writeChanged(slots), ...); }, slots_);
}

std::uint64_t Journal::entries() const {
    std::uint64_t sum = 0;
    RecordedKinds::forEach([&]<class Kind>() { sum += session_.entriesWritten(Kind::type); });
    return sum;
}

std::vector<std::pair<std::string, std::uint64_t>> Journal::entriesByKind() const {
    std::vector<std::pair<std::string, std::uint64_t>> kinds;
    RecordedKinds::forEach([&]<class Kind>() {
        if (const std::uint64_t count = session_.entriesWritten(Kind::type); count > 0)
            kinds.emplace_back(metaDataKindName(Kind::type), count);
    });
    return kinds;
}

} // namespace Recorder
