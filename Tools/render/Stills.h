#pragma once

#include "Tools/render/YuvPicture.h"

#include <string>

namespace Render {

/// Writes a picture as a PNG file that appears whole or not at all. Throws `Zulm::Failure`.
void writePng(const YuvPicture& picture, const std::string& path, const std::string& recording, bool force);

} // namespace Render
