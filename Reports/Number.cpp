#include "Reports/Number.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstdlib>
#include <string_view>
#include <system_error>

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

/// A part of a time code after its first colon: two digits that are less than 60, or one of "0:5".
bool isSixtieth(const std::string& part) {
    const std::size_t digits = std::min(part.find('.'), part.size());
    return digits >= 1 && digits <= 2 && realNumber(part).value_or(60) < 60;
}

/// "H:M:S" or "M:S" without a sign; only the seconds may have a fraction.
std::optional<double> timeCode(const std::string& word) {
    constexpr std::size_t mostColons = 2;
    if (word.find_first_not_of("0123456789:.") != std::string::npos ||
        std::count(word.begin(), word.end(), ':') > static_cast<std::ptrdiff_t>(mostColons))
        return std::nullopt;
    double seconds = 0;
    for (std::size_t begin = 0; begin <= word.size();) {
        const std::size_t end = std::min(word.find(':', begin), word.size());
        const std::string part = word.substr(begin, end - begin);
        const bool isLast = end == word.size();
        const std::optional<double> number = realNumber(part);
        if (!number || (begin > 0 && !isSixtieth(part)) || (!isLast && part.find('.') != std::string::npos))
            return std::nullopt;
        seconds = 60 * seconds + *number;
        begin = end + 1;
    }
    return seconds;
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

std::optional<std::uint64_t> wholeNumber(const std::string& text) {
    std::uint64_t number = 0;
    const char* end = text.data() + text.size();
    const auto [stop, error] = std::from_chars(text.data(), end, number);
    return error == std::errc() && stop == end ? std::optional(number) : std::nullopt;
}

std::optional<double> secondsFrom(const std::string& word, Sign sign) {
    const bool isNegative = word.starts_with('-');
    if (isNegative && (sign == Sign::NeverNegative || word.starts_with("--")))
        return std::nullopt;
    const std::string amount = isNegative ? word.substr(1) : word;
    const auto seconds = amount.find(':') == std::string::npos ? realNumber(amount) : timeCode(amount);
    if (!seconds || !std::isfinite(*seconds))
        return std::nullopt;
    return isNegative ? -*seconds : *seconds;
}

// Not every standard library has `std::to_chars` for real numbers either.
double shortestNumber(float value) {
    const std::string text = fmt::format("{}", value);
    return isWrittenOut(value, text) ? static_cast<double>(value) : *realNumber(text);
}

} // namespace Zulm
