#pragma once

#include <optional>
#include <string>

namespace Zulm {

/// All of `text` as a decimal number, "inf" and "nan" among them. None where it is anything else, or too large.
std::optional<double> realNumber(const std::string& text);

} // namespace Zulm
