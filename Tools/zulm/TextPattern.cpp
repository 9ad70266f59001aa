#include "Tools/zulm/TextPattern.h"

#include "Tools/zulm/Expression.h"

#include <CLI/CLI.hpp>
#include <fmt/core.h>

namespace Zulm {

TextPattern::TextPattern(const std::string& pattern, bool ignoreCase, bool isFixed)
    : expression_(compileExpression(pattern.data(), pattern.size(), ignoreCase, isFixed), releaseExpression) {
    if (const char* error = errorIn(*expression_))
        throw CLI::ValidationError(fmt::format("{} is no regular expression: {}", pattern, error));
}

bool TextPattern::matches(const std::string& text) const {
    return isFoundIn(text.data(), text.size(), *expression_);
}

} // namespace Zulm
