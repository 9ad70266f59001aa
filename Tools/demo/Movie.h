#pragma once

#include <string>

namespace ZULMetaData::Demo {

/// The bytes of a movie that shows one still picture for as long as the session lasts: enough for a player, and for a
/// recording's metadata to be put into.
std::string stillMovie();

} // namespace ZULMetaData::Demo
