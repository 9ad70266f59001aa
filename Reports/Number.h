#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace Zulm {

/// All of `text` as a decimal number, "inf" and "nan" among them. Empty if it is anything else, or too large.
std::optional<double> realNumber(const std::string& text);

/// All of `text` as a whole number in decimal digits and nothing else. Empty if it is anything else, or too large.
std::optional<std::uint64_t> wholeNumber(const std::string& text);

enum class Sign { NeverNegative, Any };

/// `word` as a finite time in seconds: a decimal number ("90", "12.5", "1e3") or a time code ("1:30", "00:01:02.5",
/// "1:02:03"), whose minutes and seconds after a colon are less than 60. Empty if it is anything else, or if it begins
/// with '-' and `sign` does not allow that.
std::optional<double> secondsFrom(const std::string& word, Sign sign = Sign::NeverNegative);

/// What a finite number of 32 bits is written as with the fewest characters that tell it from all others, as
/// `std::to_chars` does; as the number of 64 bits that is nearest to it.
double shortestNumber(float value);

} // namespace Zulm
