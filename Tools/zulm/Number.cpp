#include "Tools/zulm/Number.h"

#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <string_view>

namespace Zulm {

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

} // namespace Zulm
