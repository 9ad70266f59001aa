#include "ZULMetaDataSession/Picture.h"

#include "Tests/ZULMetaDataSession/SessionSamples.h"

#include <gtest/gtest.h>

#include <string>

namespace ZULMetaData::Test {
namespace {

std::string textOf(const ScreenPoint& point) {
    return shown(point.x) + ' ' + shown(point.y);
}

std::string textOf(const ScreenRect& rect) {
    return shown(rect.x) + ' ' + shown(rect.y) + ' ' + shown(rect.width) + ' ' + shown(rect.height);
}

TEST(Picture, IsFilledByTheRegion) {
    const Picture picture = RecordedArea{Rect(100, 50, 400, 200), 2}.toPicture({1600, 400});
    EXPECT_EQ(textOf(picture.region()), "100 50 400 200");
    EXPECT_EQ(picture.size(), (PictureSize{1600, 400}));
    EXPECT_EQ(textOf(picture.pixelsPerUnit()), "4 2");
    EXPECT_EQ(textOf(picture.toPixels(ScreenPoint(100, 50))), "0 0");
    EXPECT_EQ(textOf(picture.toPixels(ScreenPoint(500, 250))), "1600 400");
    EXPECT_EQ(textOf(picture.toPixels(ScreenPoint(90, 51))), "-40 2");
    EXPECT_EQ(textOf(picture.toPixels(Rect(110, 60, 10, 20))), "40 20 40 40");
    EXPECT_EQ(textOf(picture.toPixels(ScreenRect(110.5, 60, 10, 20))), "42 20 40 40");
}

TEST(Picture, ShowsTheScreenFromItsCornerWithoutARegion) {
    const Picture picture = RecordedArea{{}, 2}.toPicture({1920, 1080});
    EXPECT_EQ(textOf(picture.region()), "0 0 960 540");
    EXPECT_EQ(textOf(picture.toPixels(ScreenPoint(10, 20))), "20 40");
}

TEST(Picture, IsAsLargeAsTheRegionWasRecordedWithoutAMovie) {
    for (const PictureSize& none : {PictureSize{}, PictureSize{0, 100}, PictureSize{-1, -1}}) {
        const Picture picture = RecordedArea{Rect(-5, -5, 300, 200), 2}.toPicture(none);
        EXPECT_EQ(picture.size(), (PictureSize{600, 400}));
        EXPECT_EQ(textOf(picture.toPixels(ScreenPoint(-5, 0))), "0 10");
    }
}

TEST(Picture, HasTheUsualSizeWithoutAMovieAndARegion) {
    const Picture picture = RecordedArea().toPicture();
    EXPECT_EQ(picture.size(), (PictureSize{1280, 720}));
    EXPECT_EQ(textOf(picture.region()), "0 0 1280 720");
}

TEST(Picture, TakesAScaleBelowOneForOne) {
    for (const std::int32_t scale : {0, -2})
        EXPECT_EQ(textOf(RecordedArea{{}, scale}.toPicture({100, 100}).pixelsPerUnit()), "1 1");
}

TEST(Picture, TakesTheLargestRegion) {
    const Picture picture =
        RecordedArea{Rect(-2147483648, -2147483648, 2147483647, 2147483647), 1}.toPicture({2147483647, 2147483647});
    EXPECT_EQ(picture.toPixels(ScreenPoint(2147483647, 0)).x, 4294967295.0);
}

std::string regionEntry(double time, const Rect& region) {
    return f64(time) + raw(region);
}

RecordedArea areaOf(const std::string& regions, const std::string& scales) {
    const MemoryRecording recording(
        movieOf({streamHeader("2b7b6af6", 1, 24) + regions, streamHeader("2b7b6afb", 1, 12) + scales}));
    EXPECT_EQ(recording->area(), recording->at(-1).area);
    return recording->area();
}

TEST(RecordedArea, IsTheLastRegionWithAnArea) {
    const std::string regions = regionEntry(9, {1, 2, 30, 40}) + regionEntry(1, {5, 6, 70, 80}) +
                                regionEntry(20, {0, 0, 0, 100}) + regionEntry(21, {0, 0, 100, -1});
    EXPECT_EQ(areaOf(regions, ""), (RecordedArea{Rect(1, 2, 30, 40), 1}));
}

TEST(RecordedArea, HasTheLastScaleFactor) {
    EXPECT_EQ(areaOf("", f64(0) + raw(2) + f64(1) + raw(3)), (RecordedArea{{}, 3}));
    EXPECT_EQ(areaOf("", ""), RecordedArea());
}

} // namespace
} // namespace ZULMetaData::Test
