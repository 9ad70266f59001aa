#pragma once

namespace ZULMetaData {

/// Remembers an object that is never released, for as long as the program runs, so that leak checkers see it as
/// in use. Safe to call from several threads.
void keepReachable(const void* object);

} // namespace ZULMetaData
