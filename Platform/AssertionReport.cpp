#include "Platform/AssertionReport.h"

// The C library declares its reporting function only where `assert` is active.
#undef NDEBUG
#include <cassert>

namespace ZULMetaData {

void reportFailedAssertion(const char* expression, const char* function, const char* file, int line) noexcept {
#if defined(__APPLE__)
    __assert_rtn(function, file, line, expression);
#elif defined(__EMSCRIPTEN__)
    __assert_fail(expression, file, line, function);
#else
    __assert_fail(expression, file, static_cast<unsigned int>(line), function);
#endif
}

} // namespace ZULMetaData
