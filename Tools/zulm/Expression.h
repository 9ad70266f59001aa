#pragma once

// RE2, behind nothing but plain C types: its own interface takes and gives the strings of the standard library that it
// was compiled with, and that need not be the one of the rest of the tool.

#include <cstddef>

namespace Zulm {

class Expression;

/// To be released. `isFixed` takes every character for itself.
Expression* compileExpression(const char* pattern, std::size_t size, bool ignoreCase, bool isFixed);

/// What is wrong with it, as long as it is not released; null where nothing is.
const char* errorIn(const Expression& expression) noexcept;

/// Whether it is anywhere in the text, which is UTF-8.
bool isFoundIn(const char* text, std::size_t size, const Expression& expression);

/// Looks for it from `start` on; what precedes `start` still counts for anchors and word boundaries. Returns false if
/// it is not there, and otherwise where it begins and ends.
bool findIn(const char* text, std::size_t size, std::size_t start, const Expression& expression, std::size_t& begin,
            std::size_t& end);

void releaseExpression(Expression* expression) noexcept;

} // namespace Zulm
