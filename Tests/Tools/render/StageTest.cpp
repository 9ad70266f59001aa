// Where the parts of a film are, and the background that they lie on.

#include "Tools/render/Backdrop.h"
#include "Tools/render/Canvas.h"

#include "Tests/Tools/render/RenderSamples.h"

#include <gtest/gtest.h>

#include <algorithm>

namespace Render::Test {
namespace {

Stage stageOf(const FilmSize& film, const ZULMetaData::PictureSize& movie, double padding) {
    Style style;
    style.frame.padding = padding;
    return {film, movie, style};
}

void expectRect(const PixelRect& rect, int x, int y, int width, int height) {
    EXPECT_EQ(rect.x, x);
    EXPECT_EQ(rect.y, y);
    EXPECT_EQ(rect.width, width);
    EXPECT_EQ(rect.height, height);
}

TEST(Stage, FillsTheFilmWithoutPadding) {
    expectRect(stageOf({640, 360}, {640, 360}, 0).frame(), 0, 0, 640, 360);
    expectRect(stageOf({1280, 720}, {640, 360}, 0).frame(), 0, 0, 1280, 720);
}

TEST(Stage, CountsPaddingInPoints) {
    expectRect(stageOf({1920, 1080}, {1920, 1080}, 54).frame(), 96, 54, 1728, 972);
    expectRect(stageOf({960, 540}, {1920, 1080}, 54).frame(), 48, 28, 864, 486); // 27 is not even
    EXPECT_DOUBLE_EQ(stageOf({960, 540}, {1920, 1080}, 0).points(30), 15);
}

TEST(Stage, KeepsTheShapeOfTheMovie) {
    expectRect(stageOf({1280, 720}, {640, 480}, 0).frame(), 160, 0, 960, 720);
    expectRect(stageOf({720, 1280}, {1280, 720}, 0).frame(), 0, 438, 720, 406); // 405 and 437 are not even
}

TEST(Stage, HasAnEvenFrameWithinTheFilmWhateverTheSizes) {
    for (const FilmSize& film : {FilmSize{16, 16}, FilmSize{16, 8192}, FilmSize{8192, 16}, FilmSize{854, 480}})
        for (const ZULMetaData::PictureSize& movie :
             {ZULMetaData::PictureSize{1, 1}, ZULMetaData::PictureSize{8191, 1}, ZULMetaData::PictureSize{1, 8191},
              ZULMetaData::PictureSize{641, 361}})
            for (const double padding : {0.0, 55.5, 400.0}) {
                const PixelRect frame = stageOf(film, movie, padding).frame();
                EXPECT_EQ((frame.x | frame.y | frame.width | frame.height) & 1, 0);
                EXPECT_GE(frame.x, 0);
                EXPECT_GE(frame.y, 0);
                EXPECT_GE(frame.width, 2);
                EXPECT_GE(frame.height, 2);
                EXPECT_LE(frame.right(), film.width);
                EXPECT_LE(frame.bottom(), film.height);
            }
}

TEST(View, LooksThroughTheFrameAtAPartOfTheDisplay) {
    const Stage stage = stageOf({1920, 1080}, {1920, 1080}, 54);
    const View view(stage, {100, 50, 800, 450}, {300, 50, 400, 225});
    const ZULMetaData::ScreenPoint corner = view.toFilm({300, 50});
    EXPECT_DOUBLE_EQ(corner.x, 96);
    EXPECT_DOUBLE_EQ(corner.y, 54);
    const ZULMetaData::ScreenPoint middle = view.toFilm({500, 162.5});
    EXPECT_DOUBLE_EQ(middle.x, 960);
    EXPECT_DOUBLE_EQ(middle.y, 540);
    EXPECT_DOUBLE_EQ(view.scale().x, 4.32);
    EXPECT_EQ(view.partOf(1600, 900), (PicturePart{400, 0, 800, 450}));
}

TEST(Tile, CoversARectangleWithEvenPixels) {
    expectRect(Tile(PixelRect{3, 5, 3, 3}).place, 2, 4, 4, 4);
    expectRect(Tile(PixelRect{-3, -5, 2, 2}).place, -4, -6, 4, 4);
    EXPECT_EQ(Tile(PixelRect{3, 5, 3, 3}).pixels.size(), 16U);
    EXPECT_TRUE(Tile(PixelRect{4, 4, -9, 3}).pixels.empty());
}

TEST(Canvas, DrawsInThePixelsOfTheFilm) {
    Tile tile(PixelRect{10, 20, 4, 4});
    {
        const Canvas canvas(tile);
        canvas.setColour({1, 0, 0, 1});
        canvas.addRoundedRect(12, 20, 2, 3, 0);
        cairo_fill(canvas.context());
    }
    for (std::size_t y = 0; y < 4; ++y)
        for (std::size_t x = 0; x < 4; ++x)
            EXPECT_EQ(tile.pixels[4 * y + x], x >= 2 && y < 3 ? 0xffff0000U : 0U) << x << ", " << y;
}

TEST(Canvas, BoundsTheRadiusOfCorners) {
    Tile tile(PixelRect{0, 0, 8, 8});
    {
        const Canvas canvas(tile);
        canvas.setColour({0, 0, 0, 1}, 0.5);
        canvas.addRoundedRect(0, 0, 8, 8, 1000); // a circle
        cairo_fill(canvas.context());
    }
    EXPECT_EQ(tile.pixels[0], 0U);
    EXPECT_EQ(tile.pixels[8 * 4 + 4] >> 24U, 128U);
    EXPECT_EQ(tile.pixels[8 * 4] >> 24U, tile.pixels[8 * 3 + 7] >> 24U);
}

TEST(Canvas, DrawsOnATileWithoutPixels) {
    Tile tile(PixelRect{0, 0, 0, 0});
    const Canvas canvas(tile);
    canvas.setColour({1, 1, 1, 1});
    cairo_paint(canvas.context());
    EXPECT_TRUE(tile.pixels.empty());
}

TEST(Picture, IsFilledInWholePixels) {
    YuvPicture picture = grey(8, 8, 1);
    picture.fill({2, 3, 3, 2}, {0, 0, 0, 1});
    for (int y = 0; y < 8; ++y)
        for (int x = 0; x < 8; ++x)
            EXPECT_EQ(luma(picture, x, y), x >= 2 && x < 5 && y >= 3 && y < 5 ? 16 : 235) << x << ", " << y;
    picture.fill({-100, -100, 1000, 1000}, {0, 0, 0, 1});
    EXPECT_EQ(luma(picture, 7, 7), 16);
}

TEST(Picture, SharesItsBytesUntilItIsCopied) {
    YuvPicture picture = grey(4, 4, 1);
    const YuvPicture shared = picture;
    picture = picture.copy();
    picture.fill({0, 0, 4, 4}, {0, 0, 0, 1});
    EXPECT_EQ(luma(shared, 0, 0), 235);
    EXPECT_EQ(luma(picture, 0, 0), 16);
}

TEST(Picture, TakesATileByItsOpacityWithinAPart) {
    const YuvPicture picture = grey(8, 8, 1);
    Tile tile(PixelRect{-2, -2, 12, 12});
    std::fill(tile.pixels.begin(), tile.pixels.end(), 0xff000000U);
    blend(tile, 0.5, {0, 0, 4, 100}, picture);
    EXPECT_NEAR(luma(picture, 3, 7), (235 + 16) / 2, 1);
    EXPECT_EQ(luma(picture, 4, 7), 235);
    blend(tile, 1, {4, 4, 2, 2}, picture);
    EXPECT_EQ(luma(picture, 5, 5), 16);
    EXPECT_EQ(luma(picture, 6, 5), 235);
}

/// A style with a white background, and the film of it on which a black movie lies.
Style whiteStyle(double padding, double cornerRadius) {
    Style style;
    style.background.from = {1, 1, 1, 1};
    style.frame.padding = padding;
    style.frame.cornerRadius = cornerRadius;
    return style;
}

TEST(Backdrop, IsAsLargeAsTheFilm) {
    const Style style = whiteStyle(0, 0);
    const Backdrop backdrop(Stage({200, 108}, {100, 100}, style), style, ColourMatrix::BT709);
    EXPECT_EQ(backdrop.picture().width(), 200);
    EXPECT_EQ(backdrop.picture().height(), 108);
    EXPECT_EQ(luma(backdrop.picture(), 0, 0), 235);
}

TEST(Backdrop, CutsCornersOfTheMovieAlone) {
    const Style style = whiteStyle(0, 400); // 40 pixels
    const Backdrop backdrop(Stage({200, 108}, {200, 108}, style), style, ColourMatrix::BT709);
    const YuvPicture movie = grey(200, 108, 0);
    backdrop.cutCorners(movie);
    for (const int x : {0, 199})
        for (const int y : {0, 107})
            EXPECT_EQ(luma(movie, x, y), 235) << x << ", " << y;
    EXPECT_EQ(luma(movie, 8, 8), 235);  // 45 pixels from the middle of the circle
    EXPECT_EQ(luma(movie, 14, 14), 16); // 36 pixels
    EXPECT_EQ(luma(movie, 41, 0), 16);
    EXPECT_EQ(luma(movie, 0, 54), 16);
    EXPECT_EQ(luma(movie, 100, 54), 16);
}

TEST(Backdrop, TakesRadiiAndShadowsThatAreLargerThanTheFilm) {
    Style style = whiteStyle(400, 400);
    style.frame.shadowBlur = 200;
    style.frame.shadowOffset = 200;
    style.frame.shadowOpacity = 1;
    for (const FilmSize& film : {FilmSize{16, 16}, FilmSize{16, 512}, FilmSize{512, 16}}) {
        const Backdrop backdrop(Stage(film, {640, 360}, style), style, ColourMatrix::BT601);
        backdrop.cutCorners(grey(film.width, film.height, 0));
        EXPECT_EQ(backdrop.picture().width(), film.width);
    }
}

TEST(Backdrop, HasAShadowBelowTheMovie) {
    Style style = whiteStyle(100, 0);
    style.frame.shadowOffset = 50;
    style.frame.shadowOpacity = 1;
    const Backdrop backdrop(Stage({192, 108}, {192, 108}, style), style, ColourMatrix::BT709); // the frame ends at 98
    EXPECT_EQ(luma(backdrop.picture(), 96, 101), 16);
    EXPECT_EQ(luma(backdrop.picture(), 96, 105), 235);
    EXPECT_EQ(luma(backdrop.picture(), 96, 5), 235);
}

TEST(Backdrop, GoesFromOneColourToTheOtherInItsDirection) {
    Style style = whiteStyle(0, 0);
    style.background.to = Colour{0, 0, 0, 1};
    const Backdrop right(Stage({200, 108}, {200, 108}, style), style, ColourMatrix::BT709);
    EXPECT_GT(luma(right.picture(), 0, 50), 230);
    EXPECT_NEAR(luma(right.picture(), 100, 50), 125, 2);
    EXPECT_LT(luma(right.picture(), 199, 50), 20);
    style.background.angle = -90;
    const Backdrop up(Stage({200, 108}, {200, 108}, style), style, ColourMatrix::BT709);
    EXPECT_GT(luma(up.picture(), 100, 107), 230);
    EXPECT_LT(luma(up.picture(), 100, 0), 20);
}

} // namespace
} // namespace Render::Test
