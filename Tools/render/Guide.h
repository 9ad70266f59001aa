#pragma once

#include "Tools/render/Options.h"
#include "Tools/zulm/Command.h"

#include <string>

namespace Render {

/// One step of a guide.
struct GuideStep {
    double time = 0;   ///< in seconds of the recording
    std::string words; ///< what to do, in UTF-8
    std::string where; ///< the title and the application of the window; may be empty
};

/// Returns the steps of a recording in their order: its clicks, of which those of a double click are one, and the keys
/// that are pressed. Typed text is shown if `showsTyped`.
std::vector<GuideStep> stepsOf(const ZULMetaData::Recording& recording, double duration, bool showsTyped);

/// Writes a folder with a picture for each step, and the steps as HTML and Markdown. Throws `Zulm::Failure` and
/// `ZULMetaData::Error`.
Zulm::ExitCode makeGuide(const GuideOptions& options);

} // namespace Render
