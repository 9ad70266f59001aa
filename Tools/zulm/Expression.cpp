#include "Tools/zulm/Expression.h"

#include <re2/re2.h>

namespace Zulm {

namespace {

RE2::Options optionsFor(bool ignoreCase, bool isFixed) {
    RE2::Options options;
    options.set_log_errors(false);
    options.set_case_sensitive(!ignoreCase);
    options.set_literal(isFixed);
    return options;
}

} // namespace

class Expression : public RE2 {
public:
    using RE2::RE2;
};

Expression* compileExpression(const char* pattern, std::size_t size, bool ignoreCase, bool isFixed) {
    return new Expression(re2::StringPiece(pattern, size), optionsFor(ignoreCase, isFixed));
}

const char* errorIn(const Expression& expression) noexcept {
    return expression.ok() ? nullptr : expression.error().c_str();
}

bool isFoundIn(const char* text, std::size_t size, const Expression& expression) {
    return RE2::PartialMatch(re2::StringPiece(text, size), expression);
}

bool findIn(const char* text, std::size_t size, std::size_t start, const Expression& expression, std::size_t& begin,
            std::size_t& end) {
    re2::StringPiece found;
    if (!expression.Match(re2::StringPiece(text, size), start, size, RE2::UNANCHORED, &found, 1))
        return false;
    begin = static_cast<std::size_t>(found.data() - text);
    end = begin + found.size();
    return true;
}

void releaseExpression(Expression* expression) noexcept {
    delete expression;
}

} // namespace Zulm
