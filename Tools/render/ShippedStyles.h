#pragma once

#include <algorithm>
#include <array>
#include <string_view>

namespace Render {

/// The names of the styles that ship.
inline constexpr std::array<std::string_view, 2> s_shippedStyles{"plain", "product"};

/// Returns whether a style is one of those that ship, whatever files there are.
inline bool isShippedStyle(std::string_view name) {
    return std::find(s_shippedStyles.begin(), s_shippedStyles.end(), name) != s_shippedStyles.end();
}

/// Their JSON documents, which are in the folder styles.
///@{
extern const std::string_view s_plainStyle;
extern const std::string_view s_productStyle;
///@}

} // namespace Render
