#include "Platform/OSRelease.h"

#include <charconv>
#include <optional>
#include <sstream>
#include <system_error>

namespace ZULMetaData {

namespace {

constexpr std::string_view s_blanks = " \t\r";

bool startsWithDigit(std::string_view text) {
    return !text.empty() && text.front() >= '0' && text.front() <= '9';
}

std::string_view trimmed(std::string_view text) {
    const auto first = text.find_first_not_of(s_blanks);
    if (first == std::string_view::npos)
        return {};
    return text.substr(first, text.find_last_not_of(s_blanks) - first + 1);
}

bool isEscapable(char next, char quote) {
    return quote == '\0' || next == '"' || next == '\\' || next == '$' || next == '`';
}

/// A word of the shell: single quotes keep everything, double quotes and bare text know the backslash.
std::optional<std::string> unquoted(std::string_view word) {
    std::string value;
    char quote = '\0';
    for (std::size_t i = 0; i < word.size(); ++i) {
        const char c = word[i];
        if (c == '\\' && quote != '\'' && i + 1 < word.size() && isEscapable(word[i + 1], quote))
            value += word[++i];
        else if (quote == '\0' && (c == '"' || c == '\''))
            quote = c;
        else if (quote != '\0' && c == quote)
            quote = '\0';
        else
            value += c;
    }
    return quote == '\0' ? std::optional(value) : std::nullopt;
}

} // namespace

ReleaseNumbers parseReleaseNumbers(std::string_view release) noexcept {
    ReleaseNumbers numbers;
    for (std::int64_t* part : {&numbers.major, &numbers.minor, &numbers.patch}) {
        if (!startsWithDigit(release))
            break;
        const auto [end, error] = std::from_chars(release.data(), release.data() + release.size(), *part);
        if (error != std::errc{})
            break;
        release.remove_prefix(static_cast<std::size_t>(end - release.data()));
        if (release.empty() || release.front() != '.')
            break;
        release.remove_prefix(1);
    }
    return numbers;
}

std::string prettyNameOfOSRelease(std::string_view text) {
    constexpr std::string_view key = "PRETTY_NAME=";
    std::string name;
    std::string wholeLine;
    for (std::istringstream lines{std::string(text)}; std::getline(lines, wholeLine);) {
        const auto line = trimmed(wholeLine);
        if (line.starts_with(key))
            name = unquoted(line.substr(key.size())).value_or(std::string());
    }
    return name;
}

} // namespace ZULMetaData
