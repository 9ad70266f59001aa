#pragma once

// How a film looks: one JSON document, whose form is Docs/schemas/zulm.style.schema.json.

#include "Tools/render/YuvPicture.h"

#include <optional>
#include <string>
#include <string_view>

namespace Render {

/// Which keys are shown.
enum class KeyDisplay : std::uint8_t { Shown, Shortcuts, Hidden };

/// Lengths are in points: 1080 of them are as high as the film. What a document leaves out is as in
/// styles/product.json.
struct Style {
    struct Background {
        Colour from;
        std::optional<Colour> to; ///< the other end of a gradient
        double angle = 0;         ///< degrees, clockwise, of the direction of the gradient; 0 is to the right
    };
    struct Frame {
        double padding = 0;      ///< between the movie and the edges of the film
        double cornerRadius = 0; ///< of the movie
        double shadowBlur = 0;
        double shadowOffset = 0; ///< downward
        double shadowOpacity = 0;
    };
    struct Cursor {
        double size = 1; ///< times as large as it was
        bool isSmooth = false;
        std::optional<double> hideAfter; ///< seconds of rest
    };
    struct Clicks {
        bool isShown = true;
        Colour colour;
        double radius = 30;
        double duration = 0.6; ///< seconds
    };
    struct Keys {
        KeyDisplay display = KeyDisplay::Shortcuts;
        double size = 30; ///< of the letters
        std::string font = "Sans";
        Colour colour;
        Colour background;
    };
    struct Zoom {
        bool isAutomatic = false;
        double factor = 1;
        double settleTime = 0.6; ///< seconds
        bool followsCursor = false;
    };

    Background background;
    Frame frame;
    Cursor cursor;
    Clicks clicks;
    Keys keys;
    Zoom zoom;
};

/// Returns what "shown", "shortcuts" or "hidden" names.
std::optional<KeyDisplay> keyDisplayOf(const std::string& name);

/// Reads a document. Throws `Zulm::Failure` that names the file, the line and the key for anything that is no style.
Style readStyle(std::string_view document, const std::string& file);

/// Returns the style of this name: one of those that ship, or a file. Throws `Zulm::Failure`.
Style styleOf(const std::string& name);

} // namespace Render
