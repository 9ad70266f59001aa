#include "ZULMetaDataSession/Timeline.h"

#include "Tests/ZULMetaDataSession/SessionSamples.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>
#include <sstream>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace ZULMetaData::Test {
namespace {

using testing::ElementsAre;

constexpr double s_infinity = std::numeric_limits<double>::infinity();

/// Everything in a snapshot.
std::string textOf(const Snapshot& state) {
    std::ostringstream text;
    const auto add = [&text](const auto& value) {
        if (value)
            text << *value;
        text << '|';
    };
    text << state.time << '|';
    if (state.cursor)
        text << state.cursor->x << ' ' << state.cursor->y;
    text << '|' << state.appearance << '|';
    add(state.opacity);
    text << (state.buttons ? static_cast<int>(state.buttons->bits()) : -1) << '|';
    text << (state.modifiers ? static_cast<int>(state.modifiers->bits()) : -1) << '|';
    text << state.keys.size() << state.keys.times.data() << state.keys.values.data() << '|';
    add(state.window);
    add(state.title);
    add(state.application);
    add(state.slide.title);
    add(state.slide.text);
    add(state.slide.comment);
    add(state.hover);
    add(state.region);
    add(state.scale);
    add(state.cpu);
    add(state.area.region);
    text << state.area.scale;
    return text.str();
}

/// A recording in which all kinds change at times of their own, and sometimes several at once.
MemoryRecording livelyRecording() {
    std::mt19937 random(18);
    const auto stream = [&random](const std::string& header, double pause, auto entry) {
        std::string bytes = header;
        for (double time = 1; time < 60; time += pause * static_cast<int>(random() % 5) / 2)
            bytes += entry(std::floor(time * 8) / 8, static_cast<std::int32_t>(random() % 1000));
        return bytes;
    };
    const auto rect = [](double time, std::int32_t number) {
        return f64(time) + raw(number) + raw(number + 1) + raw(number % 7) + raw(number % 5);
    };
    const auto text = [](double time, std::int32_t number) { return textEntry(time, std::to_string(number)); };
    const auto cursor = [](double time, std::int32_t number) {
        return le32(0x1c) + f64(time) + le64(static_cast<std::uint64_t>(number)) + le32(8) + le32(0) + le32(3);
    };
    const auto number = [](double time, std::int32_t value) { return f64(time) + raw(value); };
    return MemoryRecording(movieOf({
        stream(streamHeader("2b7b6af2", 1, 16), 0.1, [](double t, std::int32_t n) { return pointEntry(t, n, -n); }),
        stream(streamHeader("2b7b6af1", 2, 0), 1, cursor),
        stream(streamHeader("2b7b6af3", 1, 16), 2, [](double t, std::int32_t n) { return f64(t) + f64(n); }),
        stream(streamHeader("2b7b6af0", 1, 12), 0.5, number),
        stream(streamHeader("2b7b6af5", 1, 16), 0.5,
               [](double t, std::int32_t n) { return f64(t) + raw(n) + raw(n << 16); }),
        stream(streamHeader("2b7b6af7", 1, 24), 3, rect),
        stream(streamHeader("2b7b6a07", 1, 0), 3, text),
        stream(streamHeader("2b7b6a06", 1, 0), 4, text),
        stream(streamHeader("2b7b6af8", 1, 0), 5, text),
        stream(streamHeader("2b7b6af9", 1, 0), 5, text),
        stream(streamHeader("2b7b6afa", 1, 0), 6, text),
        stream(streamHeader("2b7b6a09", 1, 24), 0.3, rect),
        stream(streamHeader("2b7b6af6", 1, 24), 20, rect),
        stream(streamHeader("2b7b6afb", 1, 12), 20, number),
        stream(streamHeader("2b7b6a08", 1, 12), 1, [](double t, std::int32_t n) { return f64(t) + f32(float(n)); }),
    }));
}

class PlayedTimeline : public testing::TestWithParam<Interpolation> {
protected:
    void expectSame(double time) { ASSERT_EQ(textOf(timeline.at(time)), textOf(recording->at(time, GetParam()))); }

    MemoryRecording recording = livelyRecording();
    Timeline timeline{*recording, GetParam()};
};

TEST_P(PlayedTimeline, ShowsTheSnapshotsOfItsRecordingForward) {
    for (double time = -1; time < 62; time += 1.0 / 64)
        expectSame(time);
}

TEST_P(PlayedTimeline, ShowsThemBackward) {
    for (double time = 62; time > -1; time -= 1.0 / 64)
        expectSame(time);
}

TEST_P(PlayedTimeline, ShowsThemInLargeSteps) {
    for (double time = -1; time < 62; time += 2.125)
        expectSame(time);
}

TEST_P(PlayedTimeline, ShowsThemAtAnyTime) {
    std::mt19937 random(18);
    for (int i = 0; i < 5000; ++i)
        expectSame(static_cast<int>(random() % 512) / 8.0 - 1);
}

TEST_P(PlayedTimeline, ShowsThemAtTheEndsOfTime) {
    for (const double time : {s_infinity, -s_infinity, 5.0, s_infinity, 5.0, -s_infinity, 1e300, -1e300, 5.0})
        expectSame(time);
}

TEST_P(PlayedTimeline, KnowsNothingAtNoTime) {
    timeline.at(30);
    const Snapshot& state = timeline.at(std::nan(""));
    EXPECT_FALSE(state.cursor);
    EXPECT_FALSE(state.title);
    EXPECT_FALSE(state.buttons);
    expectSame(30);
}

INSTANTIATE_TEST_SUITE_P(Every, PlayedTimeline, testing::Values(Interpolation::Linear, Interpolation::Held),
                         [](const auto& test) { return test.param == Interpolation::Linear ? "Linear" : "Held"; });

TEST(Timeline, KnowsNothingOfARecordingWithoutStreams) {
    const MemoryRecording recording(movieOf({}));
    Timeline timeline(*recording);
    EXPECT_EQ(textOf(timeline.at(5)), textOf(recording->at(5)));
    EXPECT_FALSE(timeline.at(5).cursor);
}

TEST(Timeline, CanBeCopied) {
    const MemoryRecording recording = livelyRecording();
    Timeline first(*recording);
    first.at(10);
    Timeline second = first;
    EXPECT_EQ(textOf(second.at(11)), textOf(recording->at(11)));
    EXPECT_EQ(textOf(first.at(10.5)), textOf(recording->at(10.5)));
}

TEST(Timeline, KeepsTheTracksOfARecordingThatIsGone) {
    auto recording = std::make_unique<MemoryRecording>(movieOfEveryKind());
    Timeline timeline(**recording);
    recording.reset();
    EXPECT_EQ(timeline.at(0.4).application, "Editor");
    EXPECT_EQ(timeline.at(2).application, "Game");
}

TEST(Timeline, NeedsStreamsThatCanBeDecoded) {
    const MemoryRecording recording(movieOf({locationStream(), streamHeader(s_appNames, 9, 0)}));
    EXPECT_THROW(Timeline{*recording}, Error);
}

TEST(Timeline, LeavesOutStreamsThatCannotBeDecodedIfItIsToldTo) {
    const MemoryRecording recording(
        movieOf({locationStream(), streamHeader(s_appNames, 9, 0), streamHeader("2b7b6af7", 1, 99)}), "a.mp4");
    std::vector<std::string> errors;
    Timeline timeline(*recording, [&errors](const Error& error) { errors.push_back(error.sentence().substr(0, 40)); });
    EXPECT_THAT(errors,
                ElementsAre("the stream topmostWindow states entries ", "the stream topmostAppName has version 9,"));
    EXPECT_TRUE(timeline.at(1).cursor);
    EXPECT_FALSE(timeline.at(1).application);
    EXPECT_FALSE(timeline.at(1).window);
}

TEST(Timeline, MayBePlayedByEachThread) {
    const MemoryRecording recording = livelyRecording();
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back([&recording] {
            Timeline timeline(*recording);
            for (double time = 0; time < 60; time += 0.5)
                EXPECT_EQ(textOf(timeline.at(time)), textOf(recording->at(time)));
        });
    for (std::thread& thread : threads)
        thread.join();
}

} // namespace
} // namespace ZULMetaData::Test
