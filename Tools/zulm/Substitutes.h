#pragma once

#include <algorithm>
#include <initializer_list>
#include <string>
#include <string_view>
#include <utility>

namespace Zulm {

using Substitutes = std::initializer_list<std::pair<char, std::string_view>>;

/// Returns the text with something else in place of every character that has a substitute, such as an escape.
inline std::string substituted(std::string_view text, Substitutes substitutes) {
    std::string result;
    for (const char c : text) {
        const auto isForIt = [c](const auto& substitute) { return substitute.first == c; };
        const auto found = std::find_if(substitutes.begin(), substitutes.end(), isForIt);
        result += found == substitutes.end() ? std::string_view(&c, 1) : found->second;
    }
    return result;
}

} // namespace Zulm
