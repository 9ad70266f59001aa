#pragma once

// How a film looks: one JSON document, whose form is Docs/schemas/zulm.style.schema.json.

#include "Tools/render/YuvPicture.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Render {

/// Which keys are shown.
enum class KeyDisplay : std::uint8_t { Shown, Shortcuts, Hidden };

/// Lengths are in points: 1080 of them are as high as the film.
struct Style {
    struct Background {
        Colour from{0.17, 0.20, 0.36, 1};
        std::optional<Colour> to; ///< the other end of a gradient
        double angle = 135;       ///< degrees, clockwise, of the direction of the gradient; 0 is to the right
    };
    struct Frame {
        double padding = 56;      ///< between the movie and the edges of the film
        double cornerRadius = 16; ///< of the movie
        double shadowBlur = 40;
        double shadowOffset = 14; ///< downward
        double shadowOpacity = 0.45;
    };
    struct Cursor {
        double size = 1.5; ///< times as large as it was
        bool isSmooth = true;
        std::optional<double> hideAfter; ///< seconds of rest
    };
    struct Clicks {
        bool isShown = true;
        Colour colour{0.24, 0.48, 1, 1};
        double radius = 30;
        double duration = 0.6; ///< seconds
    };
    struct Keys {
        KeyDisplay display = KeyDisplay::Shortcuts;
        double size = 30; ///< of the letters
        std::string font = "Sans";
        Colour colour{1, 1, 1, 1};
        Colour background{0.06, 0.07, 0.1, 0.86};
    };
    struct Zoom {
        bool isAutomatic = true;
        double factor = 1.5;
        double settleTime = 0.6; ///< seconds
        bool followsCursor = true;
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

/// Returns the style of this name: a file, or one of those that are installed. Throws `Zulm::Failure`.
Style styleOf(const std::string& name);

/// Returns the names of the styles that are installed.
std::vector<std::string> installedStyles();

} // namespace Render
