#pragma once

// Texts between Python and the library, whose bytes need not be UTF-8.

#include <pybind11/pybind11.h>

#include <string>

namespace ZULMetaData::Python {

namespace py = pybind11;

/// A text of a file, with what follows a zero byte in it. Bytes that are not UTF-8 become lone surrogates.
py::str pythonText(const std::string& bytes);

/// Returns a path, or a sentence with a path in it, as `os.fsdecode` returns it.
py::str pathText(const std::string& bytes);

/// The bytes of a `str`, lone surrogates as `pythonText` makes them, or of `bytes`. Throws `TypeError` for anything
/// else, and `ValueError` for a zero character.
std::string storedText(const py::handle& value);

/// Throws `ValueError`, whatever path is in its sentence.
[[noreturn]] void throwValueError(const std::string& sentence);

} // namespace ZULMetaData::Python
