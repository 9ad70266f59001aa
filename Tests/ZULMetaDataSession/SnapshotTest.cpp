#include "ZULMetaDataSession/Snapshot.h"

#include "Tests/ZULMetaDataSession/SessionSamples.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <optional>
#include <string>
#include <thread>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;

constexpr double s_infinity = std::numeric_limits<double>::infinity();

// ---- The usual distance ---------------------------------------------------------------------------------------

TEST(UsualDistance, IsTheMedianOfTheDistances) {
    EXPECT_EQ(usualDistance(std::vector<double>{0, 1, 3, 103}), 2); // 1, 2, 100
    EXPECT_EQ(usualDistance(std::vector<double>{0, 100, 102, 103}), 2);
    EXPECT_EQ(usualDistance(std::vector<double>{5, 8}), 3);
}

TEST(UsualDistance, IsTheMeanOfTheTwoInTheMiddle) {
    EXPECT_EQ(usualDistance(std::vector<double>{0, 1, 4}), 2);               // 1, 3
    EXPECT_EQ(usualDistance(std::vector<double>{0, 100, 101, 103, 107}), 3); // 1, 2, 4, 100
}

TEST(UsualDistance, LeavesOutEntriesAtTheSameTime) {
    EXPECT_EQ(usualDistance(std::vector<double>{0, 0, 0, 0, 0, 2, 2, 5}), 2.5); // 2, 3
}

TEST(UsualDistance, IsNoneWithoutTwoTimes) {
    EXPECT_EQ(usualDistance({}), 0);
    EXPECT_EQ(usualDistance(std::vector<double>{5}), 0);
    EXPECT_EQ(usualDistance(std::vector<double>{5, 5, 5}), 0);
}

// ---- The position of the cursor -------------------------------------------------------------------------------

using Positions = Track<CursorLocationKind>;

std::string positionAt(const Positions& track, double time, Interpolation interpolation = Interpolation::Linear) {
    const auto position = cursorPositionAt(track, time, interpolation, usualDistance(track.times()));
    return position ? shown(position->x) + ' ' + shown(position->y) : "-";
}

TEST(CursorPosition, IsOnAStraightLineBetweenTwoEntries) {
    const Positions track({1, 2, 3}, {{0, 0}, {100, -40}, {100, 60}});
    EXPECT_EQ(positionAt(track, 1), "0 0");
    EXPECT_EQ(positionAt(track, 1.25), "25 -10");
    EXPECT_EQ(positionAt(track, 2), "100 -40");
    EXPECT_EQ(positionAt(track, 2.5), "100 10");
    EXPECT_EQ(positionAt(track, 3), "100 60");
}

TEST(CursorPosition, IsHeldIfItIsNotInterpolated) {
    const Positions track({1, 2}, {{0, 0}, {100, -40}});
    EXPECT_EQ(positionAt(track, 1.99, Interpolation::Held), "0 0");
    EXPECT_EQ(positionAt(track, 2, Interpolation::Held), "100 -40");
    EXPECT_EQ(positionAt(track, 0.99, Interpolation::Held), "-");
}

TEST(CursorPosition, IsNotKnownBeforeTheFirstEntryAndStaysAfterTheLast) {
    const Positions track({1, 2}, {{0, 0}, {100, -40}});
    EXPECT_EQ(positionAt(track, 0.999), "-");
    EXPECT_EQ(positionAt(track, -s_infinity), "-");
    EXPECT_EQ(positionAt(track, std::numeric_limits<double>::quiet_NaN()), "-");
    EXPECT_EQ(positionAt(track, 1000), "100 -40");
    EXPECT_EQ(positionAt(track, s_infinity), "100 -40");
    EXPECT_EQ(positionAt(Positions(), 1), "-");
}

/// Entries every second, and a rest from 3 s to 10 s.
Positions tracksWithARest() {
    return {{0, 1, 2, 3, 10, 11}, {{0, 0}, {10, 0}, {20, 0}, {30, 0}, {130, 0}, {140, 0}}};
}

TEST(CursorPosition, StaysWhileNothingWasRecorded) {
    EXPECT_EQ(positionAt(tracksWithARest(), 3.5), "30 0");
    EXPECT_EQ(positionAt(tracksWithARest(), 8.99), "30 0");
    EXPECT_EQ(positionAt(tracksWithARest(), 9), "30 0");
}

TEST(CursorPosition, MovesWithinTheLastUsualDistanceOfARest) {
    EXPECT_EQ(positionAt(tracksWithARest(), 9.25), "55 0");
    EXPECT_EQ(positionAt(tracksWithARest(), 9.5), "80 0");
    EXPECT_EQ(positionAt(tracksWithARest(), 10), "130 0");
}

TEST(CursorPosition, RestsIfTheDistanceIsMoreThanTwiceTheUsualOne) {
    const std::vector<Point> points{{0, 0}, {1, 0}, {2, 0}, {3, 0}, {103, 0}};
    EXPECT_EQ(positionAt(Positions({0, 1, 2, 3, 5}, points), 4), "53 0");    // exactly twice
    EXPECT_EQ(positionAt(Positions({0, 1, 2, 3, 5.125}, points), 4), "3 0"); // a little more
}

TEST(CursorPosition, IsTheLastOfSeveralAtOneTime) {
    const Positions track({0, 1, 1, 2}, {{0, 0}, {10, 0}, {50, 0}, {60, 0}});
    EXPECT_EQ(positionAt(track, 0.5), "5 0");
    EXPECT_EQ(positionAt(track, 1), "50 0");
    EXPECT_EQ(positionAt(track, 1.5), "55 0");
}

TEST(CursorPosition, TakesTheLargestCoordinates) {
    const Positions track({0, 1}, {{-2147483648, 0}, {2147483647, 0}});
    EXPECT_EQ(cursorPositionAt(track, 0.5, Interpolation::Linear, 1)->x, -0.5);
}

TEST(CursorPosition, StaysIfTheTimesAreFurtherApartThanAnyNumber) {
    const double largest = std::numeric_limits<double>::max();
    const Positions track({-largest, largest}, {{1, 2}, {3, 4}});
    EXPECT_EQ(positionAt(track, 0), "1 2");
    EXPECT_EQ(positionAt(track, largest), "3 4");
}

// ---- Everything that holds ------------------------------------------------------------------------------------

std::string shownText(const std::optional<std::string_view>& text) {
    return text ? std::string(*text) : "-";
}

template <class Value>
std::string shownValue(const std::optional<Value>& value) {
    return value ? shown(*value) : "-";
}

std::string shownButtons(const Snapshot& state) {
    if (!state.buttons)
        return "-";
    std::string text;
    for (const MouseButton button : s_mouseButtons)
        if (state.buttons->contains(button))
            text += (text.empty() ? "" : " ") + std::string(nameOf(button));
    return text;
}

std::string shownModifiers(const Snapshot& state) {
    return state.modifiers ? shown(*state.modifiers) : "-";
}

TEST(Snapshot, KnowsNothingBeforeTheFirstEntries) {
    const MemoryRecording recording(movieOfEveryKind());
    const Snapshot state = recording->at(-1);
    EXPECT_EQ(state.time, -1);
    EXPECT_FALSE(state.cursor);
    EXPECT_EQ(state.appearance, nullptr);
    EXPECT_FALSE(state.opacity);
    EXPECT_FALSE(state.buttons);
    EXPECT_FALSE(state.modifiers);
    EXPECT_TRUE(state.keys.empty());
    EXPECT_FALSE(state.window);
    EXPECT_FALSE(state.title);
    EXPECT_FALSE(state.application);
    EXPECT_FALSE(state.slide.isKnown());
    EXPECT_FALSE(state.hover);
    EXPECT_FALSE(state.region);
    EXPECT_FALSE(state.scale);
    EXPECT_FALSE(state.cpu);
}

TEST(Snapshot, HasEverythingThatHolds) {
    const MemoryRecording recording(movieOfEveryKind());
    const Snapshot state = recording->at(0.4, Interpolation::Held);
    EXPECT_EQ(state.cursor->x, 10);
    EXPECT_EQ(state.cursor->y, -3);
    EXPECT_EQ(shown(*state.appearance), "7 flags 1 own picture of 77 bytes (3,-2) 5");
    EXPECT_EQ(state.opacity, 0.1);
    EXPECT_EQ(shownButtons(state), "left");
    EXPECT_EQ(shownModifiers(state), "+shift+cmd");
    EXPECT_EQ(shownValue(state.window), "(10,-3,100,50)");
    EXPECT_EQ(shownText(state.title), "Inbox (3)");
    EXPECT_EQ(shownText(state.application), "Editor");
    EXPECT_EQ(shownText(state.slide.title), "Intro");
    EXPECT_EQ(shownText(state.slide.text), "a\nb");
    EXPECT_EQ(shownText(state.slide.comment), "slow down");
    EXPECT_EQ(shownValue(state.hover), "(5,6,7,8)");
    EXPECT_EQ(shownValue(state.region), "(-1280,0,2560,1440)");
    EXPECT_EQ(state.scale, 2);
    EXPECT_EQ(state.cpu, 0.1F);
}

TEST(Snapshot, HasTheLastEntryAtItsVeryTime) {
    const MemoryRecording recording(movieOfEveryKind());
    const Snapshot state = recording->at(1.5);
    EXPECT_EQ(shown(*state.appearance), "7 flags 3 picture of 77 bytes (3,-2) 5");
    EXPECT_EQ(state.opacity, 1.0);
    EXPECT_EQ(shownText(state.application), "Game");
    EXPECT_EQ(shownText(state.slide.title), "Q&A");
    EXPECT_EQ(shownText(state.slide.text), "Goals");
    EXPECT_EQ(state.cpu, 99.5F);
}

TEST(Snapshot, KnowsOneTextOfASlide) {
    const MemoryRecording recording(streamHeader("2b7b6afa", 1, 0) + textEntry(1, ""), "a.dat");
    const Snapshot state = recording->at(2);
    EXPECT_TRUE(state.slide.isKnown());
    EXPECT_EQ(shownText(state.slide.comment), "");
    EXPECT_EQ(shownText(state.slide.title), "-");
}

TEST(Snapshot, HasTheKeysUpToItsTime) {
    const MemoryRecording recording(movieOfEveryKind());
    EXPECT_THAT(recording->at(0.5).keys.times, ElementsAre(0.25, 0.5));
    EXPECT_EQ(shown(recording->at(0.5).keys.values.back()), "character 13+win");
    EXPECT_EQ(recording->at(100).keys.size(), 3U);
}

TEST(Snapshot, SharesTheTextsOfTheTrack) {
    const MemoryRecording recording(movieOfEveryKind());
    EXPECT_EQ(recording->at(9).title->data(), recording->track<TopmostWindowTitleKind>().values().back().data());
    EXPECT_EQ(recording->at(9).appearance, &recording->track<CursorImageKind>().values().back());
}

TEST(Snapshot, MapsTheScreenToTheMovie) {
    const MemoryRecording recording(movieOfEveryKind());
    const ScreenPoint pixel = recording->at(-5).toPicture({5120, 2880}).toPixels(ScreenPoint(0, 720));
    EXPECT_EQ(pixel.x, 2560);
    EXPECT_EQ(pixel.y, 1440);
}

// ---- Buttons and modifiers ------------------------------------------------------------------------------------

struct Action {
    double time;
    std::int32_t stored;
};
struct Key {
    double time;
    std::uint32_t flags;
};

/// A recording of these actions and keys.
MemoryRecording recordingOf(const std::vector<Action>& actions, const std::vector<Key>& keys = {}) {
    std::string actionStream = streamHeader("2b7b6af0", 1, 12);
    for (const auto& [time, stored] : actions)
        actionStream += f64(time) + raw(stored);
    std::string keyStream = streamHeader("2b7b6af5", 1, 16);
    for (const auto& [time, flags] : keys)
        keyStream += f64(time) + le32('A') + le32(flags);
    return MemoryRecording(movieOf({actionStream, keyStream}));
}

TEST(SnapshotButtons, AreThoseThatWentDownAndDidNotComeUp) {
    const MemoryRecording recording = recordingOf({{1, 1}, {2, 4}, {3, 16}, {4, 2}, {5, 32}, {6, 8}});
    EXPECT_EQ(shownButtons(recording->at(0.9)), "-");
    EXPECT_EQ(shownButtons(recording->at(1)), "left");
    EXPECT_EQ(shownButtons(recording->at(2)), "left right");
    EXPECT_EQ(shownButtons(recording->at(3.5)), "left right middle");
    EXPECT_EQ(shownButtons(recording->at(4)), "right middle");
    EXPECT_EQ(shownButtons(recording->at(5)), "right");
    EXPECT_EQ(shownButtons(recording->at(6)), "");
}

TEST(SnapshotButtons, AreKnownFromTheFirstActionOn) {
    EXPECT_EQ(shownButtons(recordingOf({{1, 256}})->at(1)), "");
    EXPECT_EQ(shownButtons(recordingOf({{1, 64}})->at(1)), "");
    EXPECT_EQ(shownButtons(recordingOf({{1, 2}})->at(1)), "") << "a release without a press";
    EXPECT_EQ(shownButtons(recordingOf({}, {{1, 0}})->at(1)), "-") << "a key tells nothing about buttons";
}

TEST(SnapshotButtons, GoDownTwiceAndComeUpOnce) {
    EXPECT_EQ(shownButtons(recordingOf({{1, 1}, {2, 1}, {3, 2}})->at(3)), "");
    EXPECT_EQ(shownButtons(recordingOf({{1, 3}, {2, 2}})->at(1)), "left") << "the first bit decides alone";
}

TEST(SnapshotModifiers, AreThoseOfTheLastClick) {
    const MemoryRecording recording = recordingOf({{1, 1 + 16 + 128}, {2, 2 + 64}, {3, 4}});
    EXPECT_EQ(shownModifiers(recording->at(0.5)), "-");
    EXPECT_EQ(shownModifiers(recording->at(1)), "+shift+cmd");
    EXPECT_EQ(shownModifiers(recording->at(2)), "+alt");
    EXPECT_EQ(shownModifiers(recording->at(3)), "");
}

TEST(SnapshotModifiers, AreNotToldByTheMiddleButtonAndByActionsWithoutAButton) {
    EXPECT_EQ(shownModifiers(recordingOf({{1, 16 + 64}, {2, 32}, {3, 256}, {4, 128}, {5, 0}})->at(9)), "-");
    EXPECT_EQ(shownModifiers(recordingOf({{1, 1 + 16}, {2, 16}, {3, 256}, {4, 64}})->at(9)), "+shift");
}

TEST(SnapshotModifiers, AreThoseOfTheLaterOfAKeyAndAClick) {
    const MemoryRecording recording =
        recordingOf({{1, 1 + 16}, {3, 2 + 32}, {5, 16}}, {{2, 0x80010000}, {4, 0x40000000}});
    EXPECT_EQ(shownModifiers(recording->at(1)), "+shift");
    EXPECT_EQ(shownModifiers(recording->at(2)), "+alpha+win");
    EXPECT_EQ(shownModifiers(recording->at(3)), "+ctrl");
    EXPECT_EQ(shownModifiers(recording->at(4)), "");
    EXPECT_EQ(shownModifiers(recording->at(5)), "") << "the middle button says nothing";
}

TEST(SnapshotModifiers, AreThoseOfTheKeyIfAClickHasTheSameTime) {
    EXPECT_EQ(shownModifiers(recordingOf({{1, 1 + 16}}, {{1, 0x00100000}})->at(1)), "+cmd");
}

// ---- Failures and threads -------------------------------------------------------------------------------------

TEST(Snapshot, NeedsStreamsThatCanBeDecoded) {
    const MemoryRecording recording(movieOf({locationStream(), streamHeader(s_appNames, 9, 0)}));
    EXPECT_THROW(recording->at(1), Error);
    EXPECT_EQ(recording->track<CursorLocationKind>().size(), 2U);
}

TEST(Snapshot, NeedsNothingOfKindsThatItDoesNotShow) {
    const MemoryRecording recording(movieOf({locationStream(), streamHeader("2b7b6a05", 9, 16)}));
    EXPECT_TRUE(recording->at(1).cursor);
}

TEST(Snapshot, MayBeTakenByManyThreads) {
    const MemoryRecording recording(movieOfEveryKind());
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i)
        threads.emplace_back([&recording] {
            for (int round = 0; round < 100; ++round)
                EXPECT_EQ(shownText(recording->at(0.4).application), "Editor");
        });
    for (std::thread& thread : threads)
        thread.join();
}

} // namespace
} // namespace ZULMetaData::Test
