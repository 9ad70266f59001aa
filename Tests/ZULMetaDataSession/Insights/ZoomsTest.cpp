#include "ZULMetaDataSession/Insights/Zooms.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>
#include <string>

namespace ZULMetaData::Test {
namespace {

using testing::DoubleNear;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;
using testing::SizeIs;

const ScreenRect s_screen{0, 0, 3000, 1500};
constexpr std::int32_t s_highest = std::numeric_limits<std::int32_t>::max();
constexpr std::uint32_t s_command = 0x100000;
constexpr std::uint32_t s_return = 13;

/// A press that is released after 0.1 s.
Click clickAt(double time, const std::optional<Point>& position) {
    Click click;
    click.start = time;
    click.end = time + 0.1;
    click.position = position;
    return click;
}

std::vector<std::pair<double, KeyStroke>> typedAt(const std::vector<double>& times) {
    std::vector<std::pair<double, KeyStroke>> entries;
    for (const double time : times)
        entries.emplace_back(time, KeyStroke('a', 0));
    return entries;
}

/// A session of 100 seconds.
struct Session {
    std::vector<Click> clicks = {};
    std::vector<std::pair<double, KeyStroke>> keys = {};
    TrackEntries<CursorLocationKind> cursor = {};
    TrackEntries<TopmostWindowKind> windows = {};
    ScreenRect screen = s_screen;
    double duration = 100;

    std::vector<Zoom> zooms(const ZoomOptions& options = {}) const {
        return zoomsOf(clicks, Test::keys(keys), positions(cursor), trackOf<TopmostWindowKind>(windows), screen,
                       duration, options);
    }
};

auto spansAre(const std::vector<std::pair<double, double>>& spans) {
    std::vector<testing::Matcher<std::pair<double, double>>> matchers;
    for (const auto& [start, end] : spans)
        matchers.push_back(Pair(DoubleNear(start, 1e-9), DoubleNear(end, 1e-9)));
    return testing::ElementsAreArray(matchers);
}

std::vector<std::pair<double, double>> spansOf(const std::vector<Zoom>& zooms) {
    std::vector<std::pair<double, double>> spans;
    for (const Zoom& zoom : zooms)
        spans.emplace_back(zoom.start, zoom.end);
    return spans;
}

std::vector<std::pair<double, double>> centresOf(const Zoom& zoom) {
    std::vector<std::pair<double, double>> centres;
    for (const ZoomPlace& place : zoom.places)
        centres.emplace_back(place.centre.x, place.centre.y);
    return centres;
}

TEST(Zooms, AreNoneIfNothingHappens) {
    EXPECT_THAT(Session().zooms(), IsEmpty());
    EXPECT_THAT((Session{.cursor = {{0, {1, 1}}}, .windows = {{0, {0, 0, 10, 10}}}}).zooms(), IsEmpty());
}

TEST(Zooms, BeginBeforeAClickAndEndAfterIt) {
    const std::vector<Zoom> zooms = Session{.clicks = {clickAt(10, Point(1400, 700))}}.zooms();
    ASSERT_THAT(spansOf(zooms), spansAre({{9.6, 11.9}}));
    EXPECT_EQ(zooms[0].factor, 1.5);
    ASSERT_THAT(zooms[0].places, SizeIs(1));
    const ZoomPlace& place = zooms[0].places[0];
    EXPECT_EQ(place.start, zooms[0].start);
    EXPECT_EQ(place.first, 10);
    EXPECT_EQ(place.reason, ZoomReason::Clicks);
    EXPECT_EQ(place.centre.x, 1400);
    EXPECT_EQ(place.centre.y, 700);
    EXPECT_EQ(place.area.x, 400);
    EXPECT_EQ(place.area.y, 200);
    EXPECT_EQ(place.area.width, 2000);
    EXPECT_EQ(place.area.height, 1000);
}

TEST(Zooms, HaveTheLengthsAndTheFactorThatAreAskedFor) {
    const Session session{.clicks = {clickAt(10, Point(1400, 700))}};
    ZoomOptions options;
    options.lead = 1;
    options.hold = 3;
    options.factor = 4;
    const std::vector<Zoom> zooms = session.zooms(options);
    ASSERT_THAT(spansOf(zooms), spansAre({{9, 13.1}}));
    EXPECT_EQ(zooms[0].factor, 4);
    EXPECT_EQ(zooms[0].places[0].area.width, 750);
    options.factor = 0.5;
    EXPECT_EQ(session.zooms(options)[0].factor, 1);
    EXPECT_EQ(session.zooms(options)[0].places[0].area.width, 3000);
    options.lead = options.hold = 0;
    EXPECT_THAT(spansOf(session.zooms(options)), spansAre({{10, 11}}));
    options.least = 5;
    EXPECT_THAT(spansOf(session.zooms(options)), spansAre({{10, 15}}));
}

TEST(Zooms, DoNotLeaveThePicture) {
    const Session session{
        .clicks = {clickAt(10, Point(0, 0)), clickAt(20, Point(2999, 1499)), clickAt(30, Point(10, 1400))}};
    const std::vector<Zoom> zooms = session.zooms();
    ASSERT_THAT(zooms, SizeIs(3));
    EXPECT_THAT(centresOf(zooms[0]), ElementsAre(Pair(1000, 500)));
    EXPECT_THAT(centresOf(zooms[1]), ElementsAre(Pair(2000, 1000)));
    EXPECT_THAT(centresOf(zooms[2]), ElementsAre(Pair(1000, 1000)));
}

TEST(Zooms, JoinClicksThatAreCloseInTimeAndPlace) {
    const Session session{
        .clicks = {clickAt(10, Point(1400, 700)), clickAt(12.5, Point(1600, 700)), clickAt(13, Point(1500, 800))}};
    const std::vector<Zoom> zooms = session.zooms();
    ASSERT_THAT(spansOf(zooms), spansAre({{9.6, 14.9}}));
    EXPECT_THAT(centresOf(zooms[0]), ElementsAre(Pair(1500, 750)));
}

TEST(Zooms, GoFromPlaceToPlaceIfClicksAreFarFromEachOther) {
    const Session session{.clicks = {clickAt(10, Point(1100, 700)), clickAt(12, Point(1900, 700))}};
    const std::vector<Zoom> zooms = session.zooms();
    ASSERT_THAT(spansOf(zooms), spansAre({{9.6, 13.9}}));
    EXPECT_THAT(centresOf(zooms[0]), ElementsAre(Pair(1100, 700), Pair(1900, 700)));
    EXPECT_EQ(zooms[0].placeAt(0).centre.x, 1100);
    EXPECT_EQ(zooms[0].placeAt(11.5).centre.x, 1100);
    EXPECT_EQ(zooms[0].placeAt(11.6).centre.x, 1900);
    EXPECT_EQ(zooms[0].placeAt(1e9).centre.x, 1900);
    ZoomOptions options;
    options.groupDistance = 0.3;
    EXPECT_THAT(centresOf(session.zooms(options).at(0)), ElementsAre(Pair(1500, 700)));
}

TEST(Zooms, MeasureTheDistanceByTheSizeOfTheScreen) {
    const auto placesFor = [](const Point& second) {
        return Session{.clicks = {clickAt(10, Point(1500, 750)), clickAt(11, second)}}.zooms().at(0).places.size();
    };
    EXPECT_EQ(placesFor({1950, 750}), 1U) << "0.15 of the width";
    EXPECT_EQ(placesFor({1951, 750}), 2U);
    EXPECT_EQ(placesFor({1500, 975}), 1U) << "0.15 of the height";
    EXPECT_EQ(placesFor({1500, 976}), 2U);
    EXPECT_EQ(placesFor({1900, 950}), 2U) << "both together";
}

TEST(Zooms, WithAShortGapAreOne) {
    const auto spansFor = [](double second, const ZoomOptions& options = {}) {
        return spansOf(
            Session{.clicks = {clickAt(10, Point(1400, 700)), clickAt(second, Point(1400, 700))}}.zooms(options));
    };
    EXPECT_THAT(spansFor(13.09), spansAre({{9.6, 14.99}}));
    EXPECT_THAT(spansFor(13.11), spansAre({{9.6, 11.9}, {12.71, 15.01}}));
    ZoomOptions options;
    options.mergeGap = 0;
    EXPECT_THAT(spansFor(12.6, options), spansAre({{9.6, 11.9}, {12.2, 14.5}}));
    options.mergeGap = 5;
    EXPECT_THAT(spansFor(16, options), spansAre({{9.6, 17.9}}));
    options.mergeGap = -5;
    options.groupTime = 0;
    EXPECT_THAT(spansFor(12, options), spansAre({{9.6, 13.9}})) << "they would overlap";
}

TEST(Zooms, GroupClicksUpToTheTimeThatIsAskedFor) {
    const Session session{.clicks = {clickAt(10, Point(1400, 700)), clickAt(12, Point(1600, 700))}};
    EXPECT_THAT(centresOf(session.zooms().at(0)), ElementsAre(Pair(1500, 700)));
    ZoomOptions options;
    options.groupTime = 1.9;
    EXPECT_THAT(centresOf(session.zooms(options).at(0)), ElementsAre(Pair(1400, 700), Pair(1600, 700)));
}

TEST(Zooms, HoldAsLongAsADragAndShowBothEnds) {
    Click drag = clickAt(10, Point(1200, 700));
    drag.end = 15;
    drag.endPosition = Point(1600, 800);
    drag.isDrag = true;
    const std::vector<Zoom> zooms = Session{.clicks = {drag}}.zooms();
    ASSERT_THAT(spansOf(zooms), spansAre({{9.6, 16.8}}));
    EXPECT_THAT(centresOf(zooms[0]), ElementsAre(Pair(1400, 750)));
    drag.endPosition = Point(1600, 9000);
    EXPECT_THAT(centresOf(Session{.clicks = {drag}}.zooms().at(0)), ElementsAre(Pair(1200, 700)))
        << "out of the picture";
}

TEST(Zooms, AreNotMadeOfTheClickThatStopsTheRecording) {
    const Point point(1400, 700);
    EXPECT_THAT((Session{.clicks = {clickAt(99.5, point)}}).zooms(), IsEmpty());
    EXPECT_THAT((Session{.clicks = {clickAt(100.5, point)}}).zooms(), IsEmpty());
    const Session session{.clicks = {clickAt(97, point), clickAt(98, point), clickAt(98.5, point)}};
    ZoomOptions options;
    options.stopTime = 2;
    EXPECT_THAT(spansOf(session.zooms()), spansAre({{96.6, 100}}));
    EXPECT_THAT(spansOf(session.zooms(options)), spansAre({{96.6, 99.9}}));
    options.stopTime = 1.4;
    EXPECT_THAT(spansOf(session.zooms(options)), spansAre({{96.6, 100}}));
}

TEST(Zooms, NeverComeFromTheLastClickWhateverCameBefore) {
    for (std::uint64_t seed = 0; seed < 200; ++seed) {
        Numbers numbers(seed);
        Session session;
        session.duration = 20;
        for (int i = 0; i < 10; ++i)
            session.clicks.push_back(
                clickAt(numbers.below(19'000) / 1000.0, Point(numbers.below(3000), numbers.below(1500))));
        const std::vector<Zoom> without = session.zooms();
        session.clicks.push_back(clickAt(19.001 + numbers.below(998) / 1000.0, Point(numbers.below(3000), 0)));
        EXPECT_EQ(spansOf(session.zooms()), spansOf(without));
    }
}

TEST(Zooms, LieWithinTheRecording) {
    const Point point(1400, 700);
    EXPECT_THAT(spansOf(Session{.clicks = {clickAt(-5, point), clickAt(0.1, point)}}.zooms()), spansAre({{0, 2}}));
    ZoomOptions options;
    options.stopTime = -1;
    EXPECT_THAT(spansOf(Session{.clicks = {clickAt(99, point)}}.zooms(options)), spansAre({{98.6, 100}}));
    EXPECT_THAT((Session{.clicks = {clickAt(99.5, point)}}).zooms(options), IsEmpty()) << "0.9 s are too short";
    EXPECT_THAT((Session{.clicks = {clickAt(100, point)}}).zooms(options), IsEmpty());
}

TEST(Zooms, NeedAPlaceOnTheScreen) {
    EXPECT_THAT((Session{.clicks = {clickAt(10, std::nullopt)}}).zooms(), IsEmpty());
    EXPECT_THAT((Session{.clicks = {clickAt(10, Point(-1, 700))}}).zooms(), IsEmpty());
    EXPECT_THAT((Session{.clicks = {clickAt(10, Point(5, 5))}, .screen = {}}).zooms(), IsEmpty());
    const std::vector<Zoom> zooms =
        Session{.clicks = {clickAt(10, Point(-2000, 700))}, .screen = {-3000, 0, 3000, 1500}}.zooms();
    ASSERT_THAT(zooms, SizeIs(1));
    EXPECT_THAT(centresOf(zooms[0]), ElementsAre(Pair(-2000, 700)));
}

TEST(Zooms, AreMadeOfTyping) {
    const std::vector<Zoom> zooms =
        Session{.keys = typedAt({10, 11, 12.5}), .cursor = {{0, {1200, 800}}, {11, {1900, 700}}}}.zooms();
    ASSERT_THAT(spansOf(zooms), spansAre({{9.6, 14.3}}));
    EXPECT_EQ(zooms[0].places[0].reason, ZoomReason::Typing);
    EXPECT_THAT(centresOf(zooms[0]), ElementsAre(Pair(1200, 800))) << "where the cursor was at first";
}

TEST(Zooms, NeedSeveralKeysInARow) {
    const auto zoomsFor = [](const std::vector<double>& times, const ZoomOptions& options = {}) {
        return spansOf(Session{.keys = typedAt(times), .cursor = {{0, {1200, 800}}}}.zooms(options));
    };
    EXPECT_THAT(zoomsFor({10, 10.5}), IsEmpty());
    EXPECT_THAT(zoomsFor({10, 10.5, 12.1}), IsEmpty()) << "a pause of more than 1.5 s";
    ZoomOptions options;
    options.typingKeys = 1;
    EXPECT_THAT(zoomsFor({10}, options), spansAre({{9.6, 11.8}}));
    options.typingKeys = 0;
    EXPECT_THAT(zoomsFor({}, options), IsEmpty());
    options.typingKeys = 3;
    options.typingGap = 2;
    EXPECT_THAT(zoomsFor({10, 10.5, 12.1}, options), spansAre({{9.6, 13.9}}));
    EXPECT_THAT(zoomsFor({-1, 0, 0.5, 99.9, 100, 100.1}), IsEmpty()) << "keys outside the recording do not count";
}

TEST(Zooms, DoNotTakeShortcutsAndSpecialKeysForTyping) {
    Session session{.cursor = {{0, {1200, 800}}}};
    for (const double time : {10.0, 10.1, 10.2, 10.3}) {
        session.keys.emplace_back(time, KeyStroke('s', s_command));
        session.keys.emplace_back(time, KeyStroke(s_return, 0));
    }
    EXPECT_THAT(session.zooms(), IsEmpty());
}

TEST(Zooms, OfTypingGoToTheWindowIfTheCursorIsElsewhere) {
    const auto centresFor = [](const TrackEntries<CursorLocationKind>& cursor, const Rect& window) {
        const std::vector<Zoom> zooms =
            Session{.keys = typedAt({10, 10.2, 10.4}), .cursor = cursor, .windows = {{0, window}}}.zooms();
        return zooms.empty() ? std::vector<std::pair<double, double>>() : centresOf(zooms[0]);
    };
    EXPECT_THAT(centresFor({{0, {1200, 800}}}, {1000, 500, 1000, 500}), ElementsAre(Pair(1200, 800)));
    EXPECT_THAT(centresFor({{0, {900, 800}}}, {1000, 500, 1000, 500}), ElementsAre(Pair(1500, 750)));
    EXPECT_THAT(centresFor({}, {1000, 500, 1000, 500}), ElementsAre(Pair(1500, 750)));
    EXPECT_THAT(centresFor({}, {1000, 500, s_highest, s_highest}), ElementsAre(Pair(2000, 1000))) << "its visible part";
    EXPECT_THAT(centresFor({{0, {1200, 800}}}, {0, 0, 0, 0}), ElementsAre(Pair(1200, 800))) << "no window";
    EXPECT_THAT(centresFor({{0, {1200, 800}}}, {5000, 0, 100, 100}), ElementsAre(Pair(1200, 800))) << "out of sight";
    EXPECT_THAT(centresFor({}, {0, 0, 0, 0}), IsEmpty());
    EXPECT_THAT(centresFor({{0, {-5, 800}}}, {0, 0, 0, 0}), IsEmpty());
}

TEST(Zooms, GoOnFromAClickToTyping) {
    const std::vector<Zoom> zooms = Session{
        .clicks = {clickAt(10, Point(1400, 700))},
        .keys = typedAt({11, 11.2, 11.4}),
        .cursor = {{0, {1400, 700}}}}.zooms();
    ASSERT_THAT(spansOf(zooms), spansAre({{9.6, 13.2}}));
    EXPECT_THAT(zooms[0].places, SizeIs(1)) << "at the same place";
}

TEST(Zooms, AreFoundInClicksWithoutOrder) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const Point point(1400, 700);
    EXPECT_THAT(
        spansOf(Session{.clicks = {clickAt(30, point), clickAt(nan, point), clickAt(1e300, point), clickAt(10, point)}}
                    .zooms()),
        spansAre({{9.6, 11.9}, {29.6, 31.9}}));
}

TEST(Zooms, NeverOverlapNorLeaveTheScreenOrTheRecording) {
    for (std::uint64_t seed = 0; seed < 200; ++seed) {
        Numbers numbers(seed);
        Session session;
        session.duration = 60;
        session.screen = {static_cast<double>(numbers.below(400) - 200), 10, 1920, 1080};
        ZoomOptions options;
        options.factor = 1 + numbers.below(300) / 100.0;
        for (int i = 0; i < 60; ++i) {
            session.clicks.push_back(
                clickAt(numbers.below(70) - 5, Point(numbers.below(3000) - 500, numbers.below(1500) - 100)));
            session.keys.emplace_back(numbers.below(7000) / 100.0, KeyStroke('a', 0));
            session.cursor.push_back({double(numbers.below(60)), {numbers.below(3000), numbers.below(1500)}});
        }
        double last = 0;
        for (const Zoom& zoom : session.zooms(options)) {
            EXPECT_GE(zoom.start, last);
            EXPECT_GE(zoom.end - zoom.start, 1);
            EXPECT_EQ(zoom.places.front().start, zoom.start);
            last = zoom.end;
            for (const auto& [start, first, centre, area, reason] : zoom.places) {
                EXPECT_GE(start, zoom.start);
                EXPECT_LT(start, zoom.end);
                EXPECT_GE(first, start);
                EXPECT_LT(first, zoom.end);
                EXPECT_GE(area.x, session.screen.x);
                EXPECT_GE(area.y, session.screen.y);
                EXPECT_LE(area.x + area.width, session.screen.x + session.screen.width + 1e-9);
                EXPECT_LE(area.y + area.height, session.screen.y + session.screen.height + 1e-9);
            }
        }
        EXPECT_LE(last, session.duration);
    }
}

TEST(Zooms, AreMadeOfAMillionClicksAndKeysAtOneTime) {
    constexpr std::size_t count = 1'000'000;
    Session session{
        .cursor = {{0, {s_highest, s_highest}}}, .windows = {{0, {0, 0, s_highest, s_highest}}}, .duration = 1e9};
    session.screen = {-2147483648.0, -2147483648.0, 4294967295.0, 4294967295.0};
    for (std::size_t i = 0; i < count; ++i)
        session.clicks.push_back(clickAt(10, i % 2 == 0 ? Point(s_highest, s_highest) : Point(-s_highest, -s_highest)));
    session.keys = typedAt(std::vector<double>(count, 20));
    EXPECT_THAT(spansOf(session.zooms()), spansAre({{9.6, 11.9}, {19.6, 21.8}}));
}

} // namespace
} // namespace ZULMetaData::Test
