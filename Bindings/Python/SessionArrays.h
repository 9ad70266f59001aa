#pragma once

// What the session layer computes, as NumPy arrays.

#include "Bindings/Python/PythonTexts.h"

namespace ZULMetaData::Python {

/// Adds the class `Session`: a recording that was opened to ask what holds at a time, and what follows from it.
void addSession(py::module_& module);

} // namespace ZULMetaData::Python
