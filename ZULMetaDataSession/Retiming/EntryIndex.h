#pragma once

// The entries of a stream in the order of their times.

#include "ZULMetaData/StreamEntries.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::detail {

/// Returns where the time is in an entry: after its size if it has one.
inline std::size_t timeOffsetIn(const MetaDataHeader& header) {
    return header.fixedEntrySize == 0 ? sizeof(std::uint32_t) : 0;
}

/// Walks along a stream once and remembers where each entry with a finite time is. Equal times keep the order of the
/// stream. It reads the values when they are asked for.
class EntryIndex {
public:
    /// Takes a stream that can be decoded. The walk ends at the first entry that does not fit its kind. Throws `Error`
    /// that names `file` if the stream cannot be read.
    EntryIndex(const ByteSource& stream, const std::string& file);
    EntryIndex(const EntryIndex&) = delete;
    EntryIndex& operator=(const EntryIndex&) = delete;

    const MetaDataHeader& header() const { return header_; }
    std::span<const double> times() const { return times_; }
    std::size_t size() const { return times_.size(); }
    std::size_t timeOffset() const { return timeOffset_; }

    std::uint64_t timeless() const { return timeless_; } ///< returns the number of entries without a finite time
    std::uint64_t end() const { return end_; }           ///< returns the end of the last entry that fits

    std::size_t countBefore(double time) const; ///< returns the number of entries before `time`
    std::size_t countUntil(double time) const;  ///< returns the number of entries at or before `time`

    /// Throws the `Error` of an entry that is not what it was during the walk, because the file has changed.
    [[noreturn]] void refuseChange() const;

    /// Return the bytes of an entry: all of them, or those after its time. They are valid until the next call.
    ///@{
    std::string_view bytesOf(std::size_t entry);
    std::string_view valueOf(std::size_t entry) { return bytesOf(entry).substr(timeOffset_ + sizeof(double)); }
    ///@}

private:
    void add(double time, const StreamEntry& entry);
    void putInOrder();
    void keepInMemory();
    std::string_view at(std::uint64_t offset, std::uint64_t size);
    std::uint64_t offsetOf(std::size_t entry) const {
        return isDense_ ? s_metaDataHeaderSize + std::uint64_t{entry} * header_.fixedEntrySize : offsets_[entry];
    }

    std::string file_;
    ByteReader reader_;
    MetaDataHeader header_;
    std::size_t timeOffset_;
    std::vector<double> times_;
    std::vector<std::uint64_t> offsets_; ///< not used as long as entries of one size follow one another without gaps
    bool isDense_;
    std::uint64_t timeless_ = 0;
    std::uint64_t end_ = s_metaDataHeaderSize;
    std::string copy_; ///< of a stream that is not in order, unless it is large
};

} // namespace ZULMetaData::detail
