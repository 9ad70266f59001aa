#pragma once

#include <memory>
#include <string>

namespace Zulm {

class Expression;

/// A regular expression that is looked for in texts, in time that grows with the text alone, whatever the expression.
class TextPattern {
public:
    /// Throws the usage error for what is no expression. `isFixed` takes every character for itself.
    TextPattern(const std::string& pattern, bool ignoreCase, bool isFixed);

    /// Whether it is anywhere in `text`, which is UTF-8.
    bool matches(const std::string& text) const;

private:
    std::unique_ptr<Expression, void (*)(Expression*) noexcept> expression_;
};

} // namespace Zulm
