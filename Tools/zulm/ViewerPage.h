#pragma once

// The page of the viewer with a recording inside.

#include "ZULMetaDataBridge/Source/RecordingFile.h"

#include <nlohmann/json.hpp>

#include <string>
#include <string_view>

namespace Zulm {

/// The page that was built into this program; empty where none was.
std::string_view builtInPage();

/// What a page holds of a recording.
struct ViewedRecording {
    /// {"schema": "zulm.view", ...}: what `info` and `verify` tell, where the movie is, and how long the metadata is.
    nlohmann::ordered_json document;
    /// The metadata as the bytes of a small file, `packed` and in base64.
    std::string metaData;
};

/// `movie` is the address that the page finds the movie at, or null. Throws `FileError`.
ViewedRecording viewedRecording(ZULMetaData::RecordingFile& recording, const nlohmann::ordered_json& movie);

/// The address of `file` for a page in `folder`: relative, in percent encoding.
std::string relativeAddress(const std::string& file, const std::string& folder);

/// What the address of a movie that is inside the page begins with; the movie in base64 follows.
std::string embeddedAddress(const ZULMetaData::RecordingFile& recording);

/// As the text of a script element: no character ends the element.
std::string scriptText(const nlohmann::ordered_json& document);

} // namespace Zulm
