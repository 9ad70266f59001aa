#pragma once

// What the fuzz targets share. A target is one function that gets bytes and must come back: only the errors that the
// library documents may come out of it, and memory only within bounds.

#include <cstddef>
#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace Fuzz {

/// Calls `act`. What it throws must be one of the errors that the library documents for its input, or memory that was
/// refused; anything else ends the program.
void documented(const std::function<void()>& act);

/// Ends the program, as what must not happen does.
[[noreturn]] void fail(std::string_view what);

/// Whether a block of more than 16 MiB has been asked for since the last call. It was refused.
bool hasRefusedMemory();

/// A file of this program's own in a folder in memory, where there is one. Holds `bytes`.
std::string fileOf(const std::string& name, std::string_view bytes);
std::string contentsOf(const std::string& path);

/// The folder of those files.
const std::string& folder();

/// Takes a byte off the front; 0 where there is none.
std::uint8_t takeByte(std::string_view& bytes);

} // namespace Fuzz

/// The target itself, called with one input after the other.
void runTarget(std::string_view bytes);

/// Runs the target within its limits. Called by the fuzzer, and by what stands in its place.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);
