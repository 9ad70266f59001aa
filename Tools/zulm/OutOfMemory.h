#pragma once

// What becomes of the tool where memory ends.

#include <new>

namespace Zulm {

/// Asks for no memory itself.
void complainAboutMemory() noexcept;

/// From here on a failed `new` says so, removes temporary files and ends the program. An exception would not come
/// through: RE2 frees what it was building twice, text streams keep half a text, standard algorithms try it another
/// way, and the destructor of a JSON document must not throw, which asks for memory too.
void endWhereMemoryRunsOut() noexcept;

/// While it lives, a failed `new` throws again. For what has to be undone.
class MemoryRunsOutByException {
public:
    MemoryRunsOutByException() noexcept : before_(std::set_new_handler(nullptr)) {}
    ~MemoryRunsOutByException() { std::set_new_handler(before_); }
    MemoryRunsOutByException(const MemoryRunsOutByException&) = delete;
    MemoryRunsOutByException& operator=(const MemoryRunsOutByException&) = delete;

private:
    std::new_handler before_;
};

} // namespace Zulm
