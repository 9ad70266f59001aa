#pragma once

#include "ZULMetaDataSession/Insights/KeyCaptions.h"

#include <string>
#include <vector>

namespace Render {

/// A run of typed text, or one other key.
struct CaptionPart {
    std::string text; ///< UTF-8
    bool isTyped = false;

    friend bool operator==(const CaptionPart&, const CaptionPart&) = default;
};

/// Returns the label of a key as it is on a keyboard: "⌘[returnKey]" is "⌘Return".
std::string keyCap(const std::string& label);

/// Returns what of a caption is shown at a time: the keys appear as they are pressed. Typed characters are left out if
/// only shortcuts are shown.
std::vector<CaptionPart> partsAt(const ZULMetaData::KeyCaption& caption, double time, bool showsTyped);

} // namespace Render
