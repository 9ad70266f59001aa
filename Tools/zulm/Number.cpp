#include "Tools/zulm/Number.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <string_view>

namespace Zulm {

namespace {

/// Whether a whole number, told from all others by these digits, takes no more characters with all of its digits than
/// with an exponent. All of them are then its own; "100000000" may stand for a number that is a little less.
bool isWrittenOut(float value, std::string digits) {
    if (value == 0 || std::trunc(value) != value)
        return value == 0;
    digits.resize(std::min(digits.find('e'), digits.size()));
    std::erase_if(digits, [](char c) { return c < '0' || c > '9'; });
    const std::size_t telling = digits.find_last_not_of('0') + 1;
    const std::size_t written = fmt::format("{:.0f}", std::abs(value)).size();
    const std::size_t exponent = telling > 1 ? 5 : 4; // 1.2e+09, 1e+09
    return written <= telling + exponent;
}

} // namespace

// Not every standard library has `std::from_chars` for real numbers. The tool never leaves the "C" locale.
std::optional<double> realNumber(const std::string& text) {
    const std::size_t first = text.starts_with('-') ? 1 : 0;
    const bool isHexadecimal = text.find_first_of("xX") != std::string::npos;
    if (isHexadecimal || text.size() == first ||
        std::string_view(" \t\n\v\f\r+-").find(text[first]) != std::string::npos)
        return std::nullopt;
    char* end = nullptr;
    errno = 0;
    const double number = std::strtod(text.c_str(), &end);
    const bool isTooLarge = errno == ERANGE && std::abs(number) > 1;
    return end == text.c_str() + text.size() && !isTooLarge ? std::optional(number) : std::nullopt;
}

// Not every standard library has `std::to_chars` for real numbers either.
double shortestNumber(float value) {
    const std::string text = fmt::format("{}", value);
    return isWrittenOut(value, text) ? static_cast<double>(value) : *realNumber(text);
}

} // namespace Zulm
