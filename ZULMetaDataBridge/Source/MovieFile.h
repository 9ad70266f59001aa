#pragma once

// A movie that is open for changing, with everything that is changed in it: bytes that are replaced, and atoms that are
// appended. All of it can be undone.

#include "Platform/DurableFile.h"
#include "ZULMetaData/ByteSource.h"
#include "ZULMetaData/Containers/FourCC.h"
#include "ZULMetaData/Containers/RepairPlan.h"

#include <cstdint>
#include <span>
#include <vector>

namespace ZULMetaData {

/// Opens the file once and locks it against others who change it this way. Throws `std::system_error` as `DurableFile`
/// does. Undoes nothing by itself.
class MovieFile {
public:
    explicit MovieFile(const FileLocation& movie);

    /// Returns the movie as it is now, read from the same open file. This object must outlive the source.
    ByteSource bytes() const;

    /// Returns whether the movie is still the file that was opened, and not one that took its name.
    bool isInPlace() const { return file_.isNamed(location_); }

    /// Returns the end of the movie. The next bytes are appended there.
    std::uint64_t end() const { return end_; }

    /// Makes the changes one after the other, each on the disk before the next.
    void apply(const std::vector<RepairChange>& changes);

    /// Writes an atom's header at the end. Its size stays 0 until `endAtom`, so that a repair finds out how far a
    /// program got that ended in between.
    void beginAtom(FourCC type);
    void append(std::span<const char> bytes);

    /// Waits until the atom's bytes, and after them its size, are on the disk.
    void endAtom();

    /// Waits until everything that was written is on the disk.
    void sync() { file_.sync(); }

    /// Replaces bytes of what was appended, and waits until they are on the disk.
    void writeAppended(std::uint64_t offset, std::span<const char> bytes);

    /// Makes the movie byte for byte what it was. A program that ends during it leaves a movie that can be repaired.
    void undo();

private:
    FileLocation location_;
    DurableFile file_;
    std::uint64_t kept_; ///< the bytes before what was appended
    std::uint64_t end_;
    std::uint64_t atomStart_ = 0;
    std::vector<RepairChange> applied_;
};

} // namespace ZULMetaData
