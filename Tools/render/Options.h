#pragma once

// The options of `zulm render` and `zulm guide`. `zulm` describes them in its manual; the renderer reads them.

#include "Tools/render/FilmSize.h"
#include "Tools/zulm/EditOptions.h"

#include <CLI/CLI.hpp>

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
    std::optional<double> fps;
    std::string codec = "h264"; ///< of libavcodec
    std::optional<int> quality;
    bool isSilent = false;
    bool isGif = false;
    std::string frames;     ///< a folder, or empty
    std::vector<double> at; ///< the times of the film of the frames
};

struct GuideOptions : SourceOptions {
    std::string folder;
};

/// Returns the files that a command reads, as they were named.
///@{
std::vector<std::string> inputsOf(const SourceOptions& options);
std::vector<std::string> inputsOf(const RenderOptions& options);
///@}

/// Add the command that reads the options.
///@{
CLI::App* addRenderOptions(CLI::App& app, RenderOptions& options);
CLI::App* addGuideOptions(CLI::App& app, GuideOptions& options);
///@}

/// Throws the usage error unless the options make sense together.
void requireSense(const RenderOptions& options);

} // namespace Render
