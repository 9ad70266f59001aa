#pragma once

// Watches a program of hostile cases: how much memory it holds, how long a case takes, and which one it was that
// ended it.

#include <cstddef>
#include <string>

namespace Reliability {

/// From now on memory is refused that would make this program hold more than `bytes` above what it holds now. Counted
/// is what the program and the library ask for, by `new`, `malloc` and `calloc`; not what libpng and libtiff do.
void limitMemory(std::size_t bytes);
void liftMemoryLimit();

/// Whether memory has been refused since the limit was set.
bool hasRefusedMemory();

/// What to tell should the case never end (in ten seconds) or end the program.
void beginCase(const std::string& name);

/// Messages of the library lead nowhere from now on; those of `tell` go to standard error still.
void silence();
void tell(const std::string& line);

} // namespace Reliability
