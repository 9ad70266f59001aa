#pragma once

// Changes to a movie that can all be undone: bytes that are replaced, and atoms that are appended.

#include "Platform/DurableFile.h"
#include "ZULMetaData/Containers/RepairPlan.h"

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace ZULMetaData {

/// Throws `std::system_error` as `DurableFile` does. Undoes nothing of its own accord.
class MovieTransaction {
public:
    explicit MovieTransaction(const FileLocation& movie);

    /// Where the movie ends, and the next bytes go.
    std::uint64_t end() const { return end_; }

    /// Returns when all of them are on the disk, one after the other.
    void apply(const std::vector<RepairChange>& changes);

    /// Writes an atom's header at the end. Its size stays 0 until `endAtom`, so that whatever happens in between, a
    /// repair finds out how far it got.
    void beginAtom(std::uint32_t type);
    void append(std::span<const char> bytes);

    /// Returns when the atom's bytes, and after them its size, are on the disk. Gives that size.
    std::uint64_t endAtom();

    /// Returns when all that was written is on the disk.
    void sync() { file_.sync(); }

    /// Replaces bytes of what was appended. Returns when they are on the disk.
    void writeAppended(std::uint64_t offset, std::span<const char> bytes);

    /// Makes the movie byte for byte what it was. Interrupted at any point, it leaves a movie that can be repaired.
    void undo();

private:
    DurableFile file_;
    std::uint64_t kept_; ///< what is in front of what was appended
    std::uint64_t end_;
    std::uint64_t atomStart_ = 0;
    std::vector<RepairChange> applied_;
};

} // namespace ZULMetaData
