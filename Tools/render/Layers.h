#pragma once

// What is drawn over the movie.

#include "Tools/render/Canvas.h"
#include "Tools/render/FilmSession.h"
#include "Tools/render/KeyCaps.h"
#include "Tools/render/Stage.h"

#include <map>
#include <optional>
#include <vector>

namespace Render {

/// Draws the cursor with its hot spot where it belongs.
class CursorLayer {
public:
    explicit CursorLayer(const Style::Cursor& style) : style_(style) {}

    void draw(const CursorState& cursor, const Stage& stage, const View& view, const YuvPicture& picture);

private:
    struct Bitmap {
        std::vector<std::uint32_t> pixels; ///< empty if the picture cannot be decoded
        int width = 0;
        int height = 0;
    };

    Bitmap& bitmapOf(const ZULMetaData::CursorPicture& picture);

    Style::Cursor style_;
    std::map<const ZULMetaData::CursorPicture*, Bitmap> bitmaps_;
    std::size_t bitmapBytes_ = 0; ///< of all of them
};

/// Draws a ring that grows for every click.
void drawClick(const ShownClick& click, const Style::Clicks& style, const Stage& stage, const View& view,
               const YuvPicture& picture);

/// Draws the keys that are pressed.
class CaptionLayer {
public:
    explicit CaptionLayer(const Style::Keys& style) : style_(style) {}

    void draw(const ZULMetaData::KeyCaption* caption, double film, const Stage& stage, const YuvPicture& picture);

private:
    Tile made(const Stage& stage) const;

    Style::Keys style_;
    std::vector<CaptionPart> shown_;
    Tile tile_;
};

} // namespace Render
