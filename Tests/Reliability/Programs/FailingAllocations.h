#pragma once

// Stands in front of the C library's malloc, calloc, realloc and free, and so of new and delete and of every library
// that a program uses: counts, and lets allocations fail.

namespace Reliability {

/// Counts from 1 on again. The allocation of this number fails, 0 is none; with `andAllBehind` so do those behind it.
void failAllocation(long number, bool andAllBehind);

/// Nothing fails any more. Gives how many allocations there have been since `failAllocation`.
long stopFailing();

/// Blocks that were allocated and not freed.
long blocksHeld();

} // namespace Reliability
