#pragma once

// Marks the functions and classes that a shared library of this project exports. Everything else in the library is
// hidden, except inline functions and templates, which every program compiles for itself.

#if defined(ZULMETADATA_STATIC)
#define ZULMETADATA_API
#else
#define ZULMETADATA_API __attribute__((visibility("default"))) ///< marks what programs may call
#endif
