#pragma once

#include <memory>
#include <string>
#include <vector>

namespace Zulm {

class Expression;

/// A regular expression that is looked for in texts, in time that grows with the text alone, whatever the expression.
/// A text matches whichever canonical normal form of Unicode it and the expression are written in.
class TextPattern {
public:
    /// Throws the usage error for what is no expression. `isFixed` takes every character for itself.
    TextPattern(const std::string& pattern, bool ignoreCase, bool isFixed);

    /// Returns whether the expression is found anywhere in `text`, which is UTF-8.
    bool matches(const std::string& text) const;

    /// Returns the parts of `text` that match, from left to right, without those that are empty. If a text matches
    /// only in the composed form, its parts are in that form.
    std::vector<std::string> partsOf(const std::string& text) const;

private:
    using ExpressionOwner = std::unique_ptr<Expression, void (*)(Expression*) noexcept>;

    ExpressionOwner expression_; ///< as it was given
    ExpressionOwner composed_;   ///< in the normal form NFC
    bool isComposed_;            ///< both are the same
};

} // namespace Zulm
