#pragma once

// The command lines of `zulm render` and `zulm guide`.

#include "Tools/render/FilmWriter.h"
#include "Tools/render/Stage.h"
#include "Tools/zulm/EditOptions.h"

#include <optional>
#include <string>
#include <vector>

namespace Render {

/// What both commands take.
struct SourceOptions {
    std::string recording;
    std::string style = "product";
    std::string redactions; ///< a file, or empty
    std::string keys;       ///< in place of what the style says
    std::string zoom;       ///< "auto", "off", a file, or empty
    std::optional<double> cursorSize;
    bool isRaw = false;              ///< the cursor moves as it was recorded
    std::optional<double> hideAfter; ///< seconds
    std::optional<FilmSize> size;
    bool force = false;
};

struct RenderOptions : SourceOptions {
    std::string output;
    Zulm::EditOptions edits;
    bool removesIdle = false;
    double idleLeast = 5; ///< seconds without activity that are cut
    double idleRest = 1;  ///< seconds that are left of them
    FilmSettings film;
    bool hasFps = false;
    bool isSilent = false;
    bool isGif = false;
    std::string frames;     ///< a folder, or empty
    std::vector<double> at; ///< the times of the film of the frames
};

/// Returns the files that a command reads, as they were named.
///@{
std::vector<std::string> inputsOf(const SourceOptions& options);
std::vector<std::string> inputsOf(const RenderOptions& options);
///@}

struct GuideOptions : SourceOptions {
    std::string folder;
};

/// Returns nothing after --help or --version. Throws `CLI::ParseError` for options that make no sense.
///@{
std::optional<RenderOptions> renderOptionsOf(std::vector<std::string> words);
std::optional<GuideOptions> guideOptionsOf(std::vector<std::string> words);
///@}

} // namespace Render
