#include "Tools/zulm/TextPattern.h"

#include "SharedDependencies/UTF8.h"
#include "Tools/zulm/Expression.h"
#include "Tools/zulm/NormalForm.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>

namespace Zulm {

namespace {

std::unique_ptr<Expression, void (*)(Expression*) noexcept> compiled(const std::string& pattern, bool ignoreCase,
                                                                     bool isFixed) {
    return {compileExpression(pattern.data(), pattern.size(), ignoreCase, isFixed), releaseExpression};
}

/// Where the next character of UTF-8 begins.
std::size_t afterCharacter(const std::string& text, std::size_t position) {
    do
        ++position;
    while (position < text.size() && ZULMetaData::continuesCharacter(text[position]));
    return position;
}

std::vector<std::string> partsIn(const std::string& text, const Expression& expression) {
    std::vector<std::string> parts;
    std::size_t begin = 0;
    std::size_t end = 0;
    for (std::size_t start = 0;
         start <= text.size() && findIn(text.data(), text.size(), start, expression, begin, end);) {
        if (end > begin)
            parts.push_back(text.substr(begin, end - begin));
        start = end > begin ? end : afterCharacter(text, end);
    }
    return parts;
}

} // namespace

TextPattern::TextPattern(const std::string& pattern, bool ignoreCase, bool isFixed)
    : expression_(compiled(pattern, ignoreCase, isFixed)), composed_(compiled(composed(pattern), ignoreCase, isFixed)),
      isComposed_(composed(pattern) == pattern) {
    if (const char* error = errorIn(*expression_))
        throw CLI::ValidationError(fmt::format("{} is no regular expression: {}", pattern, error));
}

bool TextPattern::matches(const std::string& text) const {
    if (isFoundIn(text.data(), text.size(), *expression_))
        return true;
    const std::string form = composed(text);
    if (isComposed_ && form == text)
        return false; // that has been tried
    return isFoundIn(form.data(), form.size(), *composed_);
}

std::vector<std::string> TextPattern::partsOf(const std::string& text) const {
    std::vector<std::string> parts = partsIn(text, *expression_);
    return parts.empty() ? partsIn(composed(text), *composed_) : parts;
}

} // namespace Zulm
