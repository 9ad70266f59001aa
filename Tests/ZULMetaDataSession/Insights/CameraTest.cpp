#include "ZULMetaDataSession/Insights/Camera.h"

#include "Tests/ZULMetaDataSession/Insights/Tracks.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <bit>
#include <cmath>
#include <limits>

namespace ZULMetaData::Test {
namespace {

const ScreenRect s_screen{0, 0, 3000, 1500};
const CursorPath s_noCursor;

ZoomPlace placeAt(double start, const ScreenPoint& centre, double factor = 1.5) {
    ZoomPlace place;
    place.start = start;
    place.first = start + 0.4;
    place.centre = centre;
    place.area = zoomedArea(s_screen, centre, factor);
    return place;
}

Zoom zoomOf(double start, double end, const ScreenPoint& centre) {
    return {start, end, 1.5, {placeAt(start, centre)}};
}

Camera cameraOn(const std::vector<Zoom>& zooms, const CameraOptions& options = {}) {
    return {zooms, s_noCursor, s_screen, options};
}

CursorPath pathOf(const TrackEntries<CursorLocationKind>& entries) {
    return {positions(entries), {}};
}

void expectWholeScreen(const CameraView& view, const ScreenRect& screen = s_screen) {
    EXPECT_EQ(view.zoom, 1);
    EXPECT_EQ(view.area.x, screen.x);
    EXPECT_EQ(view.area.y, screen.y);
    EXPECT_EQ(view.area.width, screen.width);
    EXPECT_EQ(view.area.height, screen.height);
}

TEST(Camera, ShowsTheWholeScreenWithoutAZoom) {
    for (const double time : {-1e300, 0.0, 1e9, std::numeric_limits<double>::infinity()})
        expectWholeScreen(cameraOn({}).at(time));
    expectWholeScreen(Camera().at(1), {});
}

TEST(Camera, ZoomsInAndOutAgain) {
    const Camera camera = cameraOn({zoomOf(10, 20, {1200, 600})});
    expectWholeScreen(camera.at(9.999));
    expectWholeScreen(camera.at(10));
    const CameraView view = camera.at(19.999);
    EXPECT_NEAR(view.zoom, 1.5, 1e-9);
    EXPECT_NEAR(view.area.width, 2000, 1e-6);
    EXPECT_NEAR(view.centre.x, 1200, 1e-6);
    EXPECT_NEAR(view.centre.y, 600, 1e-6);
    EXPECT_GT(camera.at(20.1).zoom, 1.2);
    for (const double time : {100.0, 1e9, 1e300, std::numeric_limits<double>::infinity()})
        expectWholeScreen(camera.at(time));
}

TEST(Camera, IsAlmostThereAfterTheTimeThatIsAskedFor) {
    for (const double settleTime : {0.2, 0.6, 3.0}) {
        CameraOptions options;
        options.settleTime = settleTime;
        const Camera camera = cameraOn({zoomOf(10, 60, {1200, 600})}, options);
        EXPECT_NEAR(camera.at(10 + settleTime).zoom, 1 + 0.95 * 0.5, 1e-9);
        EXPECT_NEAR(camera.at(10 + settleTime).centre.x, 1500 - 0.95 * 300, 1e-6);
    }
    CameraOptions options;
    for (const double odd : {0.0, -1.0, std::numeric_limits<double>::quiet_NaN()}) {
        options.settleTime = odd;
        EXPECT_NEAR(cameraOn({zoomOf(10, 60, {1200, 600})}, options).at(10.001).zoom, 1 + 0.95 * 0.5, 1e-9) << odd;
    }
}

TEST(Camera, FollowsTheFormulaOfACriticallyDampedSpring) {
    const Camera camera = cameraOn({zoomOf(10, 60, {1200, 600})});
    for (int i = 0; i <= 300; ++i) {
        const double seconds = i / 100.0;
        const double x = 4.743864518390578 / 0.6 * seconds;
        EXPECT_NEAR(camera.at(10 + seconds).zoom, 1.5 - 0.5 * (1 + x) * std::exp(-x), 1e-12);
    }
}

TEST(Camera, DoesNotSwingOver) {
    const Camera camera = cameraOn({zoomOf(10, 20, {1200, 600}), zoomOf(20.3, 20.4, {1800, 900})});
    double last = 1;
    for (int i = 0; i < 1000; ++i) {
        const double zoom = camera.at(10 + i / 100.0).zoom;
        EXPECT_GE(zoom, last);
        EXPECT_LE(zoom, 1.5);
        last = zoom;
    }
    for (int i = 0; i < 1000; ++i)
        EXPECT_GE(camera.at(20 + i / 100.0).zoom, 1);
}

TEST(Camera, MovesWithoutAJump) {
    TrackEntries<CursorLocationKind> entries;
    Numbers numbers(1);
    for (int i = 0; i <= 600; ++i)
        entries.push_back({i / 60.0, {numbers.below(3000), numbers.below(1500)}});
    Zoom zoom = zoomOf(2, 7, {1200, 600});
    zoom.places.push_back(placeAt(4, {1900, 900}));
    const Camera camera({zoom}, pathOf(entries), s_screen);
    CameraView last = camera.at(0);
    for (int i = 1; i <= 10'000; ++i) {
        const CameraView view = camera.at(i / 1000.0);
        EXPECT_NEAR(view.zoom, last.zoom, 0.002);
        EXPECT_NEAR(view.centre.x, last.centre.x, 10);
        EXPECT_NEAR(view.centre.y, last.centre.y, 10);
        last = view;
    }
}

TEST(Camera, GoesFromPlaceToPlace) {
    Zoom zoom = zoomOf(10, 30, {1200, 600});
    zoom.places.push_back(placeAt(20, {1900, 900}));
    const Camera camera = cameraOn({zoom});
    EXPECT_NEAR(camera.at(19.9).centre.x, 1200, 1e-6);
    EXPECT_NEAR(camera.at(29.9).centre.x, 1900, 1e-6);
    EXPECT_NEAR(camera.at(29.9).centre.y, 900, 1e-6);
    EXPECT_NEAR(camera.at(21).zoom, 1.5, 1e-9);
}

TEST(Camera, FollowsACursorThatLeavesTheMiddle) {
    TrackEntries<CursorLocationKind> entries{{0, {1200, 600}}};
    for (int i = 0; i <= 60; ++i)
        entries.push_back({15 + i / 60.0, {1200 + 10 * i, 600}}); // to 1800
    const CursorPath path = pathOf(entries);
    const std::vector<Zoom> zooms{zoomOf(10, 30, {1200, 600})};
    EXPECT_NEAR(Camera(zooms, path, s_screen).at(14.9).centre.x, 1200, 1e-6);
    EXPECT_NEAR(Camera(zooms, path, s_screen).at(29).centre.x, 1300, 1e-6) << "0.25 of 2000 from the cursor";
    CameraOptions options;
    options.deadZone = 0.1;
    EXPECT_NEAR(Camera(zooms, path, s_screen, options).at(29).centre.x, 1600, 1e-6);
    options.deadZone = 0;
    EXPECT_NEAR(Camera(zooms, path, s_screen, options).at(29).centre.x, 1800, 1e-6);
    options.followsCursor = false;
    EXPECT_NEAR(Camera(zooms, path, s_screen, options).at(29).centre.x, 1200, 1e-6);
}

TEST(Camera, StaysWithACursorThatRestsAtTheEdge) {
    const CursorPath path = pathOf({{0, {1200, 600}}, {12, {1200, 600}}, {12.01, {2990, 20}}});
    const CameraView view = Camera({zoomOf(10, 30, {1200, 600})}, path, s_screen).at(29);
    EXPECT_NEAR(view.area.x, 1000, 1e-6);
    EXPECT_NEAR(view.area.y, 0, 1e-6);
}

TEST(Camera, LooksAtThePlaceUntilTheFirstClick) {
    const CursorPath path = pathOf({{0, {0, 0}}, {10.3, {0, 0}}, {10.35, {1200, 600}}});
    const Camera camera({zoomOf(10, 30, {1200, 600})}, path, s_screen);
    const Camera still = cameraOn({zoomOf(10, 30, {1200, 600})});
    for (int i = 0; i < 100; ++i)
        EXPECT_NEAR(camera.at(10 + i / 10.0).centre.x, still.at(10 + i / 10.0).centre.x, 1e-9);
}

TEST(Camera, ShowsTheSameAtATimeWhateverWasAskedBefore) {
    TrackEntries<CursorLocationKind> entries;
    Numbers numbers(2);
    for (int i = 0; i <= 600; ++i)
        entries.push_back({i / 60.0, {numbers.below(3000), numbers.below(1500)}});
    const Camera camera({zoomOf(2, 7, {1200, 600})}, pathOf(entries), s_screen);
    std::vector<double> forward;
    for (int i = 0; i <= 1000; ++i)
        forward.push_back(camera.at(i / 100.0).centre.x);
    for (int i = 1000; i >= 0; --i)
        EXPECT_EQ(camera.at(i / 100.0).centre.x, forward[static_cast<std::size_t>(i)]);
}

TEST(Camera, NeverLeavesThePicture) {
    for (std::uint64_t seed = 0; seed < 100; ++seed) {
        Numbers numbers(seed);
        const ScreenRect screen{static_cast<double>(numbers.below(1000)), static_cast<double>(numbers.below(1000)),
                                static_cast<double>(1 + numbers.below(3000)),
                                static_cast<double>(1 + numbers.below(3000))};
        TrackEntries<CursorLocationKind> entries;
        std::vector<Click> clicks;
        for (int i = 0; i < 300; ++i) {
            const Point point(numbers.below(5000) - 500, numbers.below(5000) - 500);
            entries.push_back({i / 10.0 + numbers.below(100) / 1000.0, point});
            if (numbers.below(20) == 0) {
                Click click;
                click.start = click.end = entries.back().first;
                click.position = point;
                clicks.push_back(click);
            }
        }
        ZoomOptions zooming;
        zooming.factor = 1 + numbers.below(500) / 100.0;
        CameraOptions options;
        options.deadZone = numbers.below(6) / 10.0;
        options.settleTime = (1 + numbers.below(200)) / 100.0;
        const Track<CursorLocationKind> track = positions(entries);
        const Camera camera(zoomsOf(clicks, {}, track, {}, screen, 30, zooming), CursorPath(track, clicks), screen,
                            options);
        for (int i = 0; i < 4000; ++i) {
            const CameraView view = camera.at(numbers.below(31'000) / 1000.0);
            ASSERT_GE(view.zoom, 1);
            ASSERT_LE(view.zoom, zooming.factor + 1e-9);
            ASSERT_GE(view.area.x, screen.x);
            ASSERT_GE(view.area.y, screen.y);
            ASSERT_LE(view.area.x + view.area.width, screen.x + screen.width);
            ASSERT_LE(view.area.y + view.area.height, screen.y + screen.height);
            ASSERT_NEAR(view.area.width * view.zoom, screen.width, 1e-9);
        }
    }
}

TEST(Camera, KnowsATimeInTheFarFuture) {
    const CursorPath path = pathOf({{0, {0, 0}}, {1e9, {100, 100}}, {2e9, {2000, 700}}});
    const Camera camera({zoomOf(1, 1.5e9, {1200, 600})}, path, s_screen);
    EXPECT_NEAR(camera.at(1e9 - 1).zoom, 1.5, 1e-9);
    expectWholeScreen(camera.at(3e9));
}

TEST(Camera, StaysFiniteForOddNumbers) {
    const double huge = std::numeric_limits<double>::max();
    const double tiny = std::numeric_limits<double>::denorm_min();
    constexpr std::int32_t high = std::numeric_limits<std::int32_t>::max();
    const CursorPath path =
        pathOf({{-huge, {-high, high}}, {0, {0, 0}}, {tiny, {high, high}}, {1e300, {-high, 0}}, {huge, {high, 8}}});
    const Camera camera({zoomOf(0, tiny, {1200, 600}), zoomOf(tiny, 1e300, {1, 1}), zoomOf(1e300, huge, {5, 5})}, path,
                        s_screen);
    for (const double time :
         {-huge, 0.0, tiny, 1.0, 1e15, 1e299, 1e300, huge, std::numeric_limits<double>::quiet_NaN()}) {
        const CameraView view = camera.at(time);
        EXPECT_TRUE(std::isfinite(view.centre.x) && std::isfinite(view.centre.y)) << time;
        EXPECT_GE(view.zoom, 1);
        EXPECT_GE(view.area.x, 0);
    }
}

TEST(Camera, TakesZoomsInAnyOrder) {
    const Camera camera = cameraOn({zoomOf(20, 30, {1200, 600}), zoomOf(10, 15, {1900, 600}), {5, 6, 2, {}}});
    for (int i = 0; i < 400; ++i)
        EXPECT_GE(camera.at(i / 10.0).zoom, 1);
}

TEST(Camera, IsTheSameOnEveryMachine) {
    TrackEntries<CursorLocationKind> entries;
    Numbers numbers(3);
    for (int i = 0; i <= 6000; ++i)
        entries.push_back({i / 64.0, {numbers.below(3000), numbers.below(1500)}});
    const Camera camera({zoomOf(2, 30, {1200, 600}), zoomOf(40, 70, {1900, 600})}, pathOf(entries), s_screen);
    std::uint64_t digest = 14695981039346656037ULL; // FNV-1a
    for (int i = 0; i < 5000; ++i) {
        const CameraView view = camera.at(i / 59.94);
        for (const double number : {view.centre.x, view.centre.y, view.zoom})
            digest = (digest ^ std::bit_cast<std::uint64_t>(number)) * 1099511628211ULL;
    }
    EXPECT_EQ(digest, 11549251000420933159ULL);
}

} // namespace
} // namespace ZULMetaData::Test
