#include "Tools/zulm/TextPattern.h"

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

} // namespace Zulm
