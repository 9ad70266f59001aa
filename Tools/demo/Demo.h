#pragma once

#include "Platform/FileLocation.h"

#include <functional>
#include <string_view>

namespace ZULMetaData::Demo {

/// Records a session into stream files in `folder`, attaches them to `movie`, stamps it, reads everything back out of
/// it and prints a table. True where all that was read is what was recorded.
bool runDemo(const FileLocation& folder, const FileLocation& movie, const std::function<void(std::string_view)>& print);

} // namespace ZULMetaData::Demo
