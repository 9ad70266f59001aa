#pragma once

// Marks what a shared library of this project shows to programs. All else in it stays inside, but for inline functions
// and templates, which every program compiles for itself.

#if defined(ZULMETADATA_STATIC)
#define ZULMETADATA_API
#else
#define ZULMETADATA_API __attribute__((visibility("default"))) ///< in front of what programs may call
#endif
