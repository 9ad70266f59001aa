#pragma once

// RE2, behind nothing but plain C types: its own interface takes and gives the strings of the standard library that it
// was compiled with, and that need not be the one of the rest of the tool.

#include <cstddef>

namespace Zulm {

class Expression;

/// To be released. `isFixed` takes every character for itself.
Expression* compileExpression(const char* pattern, std::size_t size, bool ignoreCase, bool isFixed);

/// Returns what is wrong with the expression, or null. Valid until the expression is released.
const char* errorIn(const Expression& expression) noexcept;

/// Returns whether the expression is found anywhere in the text, which is UTF-8.
bool isFoundIn(const char* text, std::size_t size, const Expression& expression);

/// Searches the text from `start` on; what precedes `start` still counts for anchors and word boundaries. Returns
/// whether the expression was found, and sets `begin` and `end` then.
bool findIn(const char* text, std::size_t size, std::size_t start, const Expression& expression, std::size_t& begin,
            std::size_t& end);

void releaseExpression(Expression* expression) noexcept;

} // namespace Zulm
