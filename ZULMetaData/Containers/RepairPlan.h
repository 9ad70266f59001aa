#pragma once

// What must change in a movie so that its atoms fill the file, and what is appended to it can be found. Nothing is
// written here; `SafeMovieSave` carries a plan out.
//
// A plan mends a last atom with an open end, an append that was interrupted, metadata at the end of the movie that was
// cut short or has stray bytes after it, and a movie that `Util::finalizeAtomsInFile` left 8 bytes short. It changes
// nothing if two readings are possible.

#include "../../SharedDependencies/Export.h"
#include "../ByteSource.h"

#include <cstdint>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Bytes of a movie that a repair replaces.
struct RepairChange {
    std::uint64_t offset = 0; ///< in the movie
    std::string before;       ///< what stands there now
    std::string after;        ///< as long as `before`; or empty, if the file's last bytes are cut off
    std::string reason;       ///< one sentence
};

/// What is wrong with a movie, and what mends it.
struct RepairPlan {
    /// An unrepairable movie has a finding, but no changes.
    enum State : std::int32_t { Whole, Repairable, Unrepairable };

    State state = Whole;               ///< repairable if there are changes
    std::vector<RepairChange> changes; ///< each must be on the disk before the next is made
    std::string finding;               ///< what is wrong, in one sentence; empty if nothing is
    std::uint64_t offset = 0;          ///< of the atom that is wrong
    bool hasLoss = false;              ///< part of the metadata at the end of the movie is missing
    std::string loss;                  ///< what is missing, as a clause about the atom of the finding; else empty
};

/// Reads the headers of the movie's atoms, and the entries of a stream whose append was interrupted. Throws
/// `std::system_error` if reading fails.
ZULMETADATA_API RepairPlan planRepair(const ByteSource& movie);

} // namespace ZULMetaData
