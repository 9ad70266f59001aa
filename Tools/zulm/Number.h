#pragma once

#include <optional>
#include <string>

namespace Zulm {

/// All of `text` as a decimal number, "inf" and "nan" among them. None where it is anything else, or too large.
std::optional<double> realNumber(const std::string& text);

/// What a finite number of 32 bits is written as with the fewest characters that tell it from all others, as
/// `std::to_chars` does; as the number of 64 bits that is nearest to it.
double shortestNumber(float value);

} // namespace Zulm
