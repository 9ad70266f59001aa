#pragma once

// Finds metadata streams that a walk along the container cannot reach: after a broken atom or one with a wrong size, in
// a file that was cut short, or without any container. All bytes of the file are searched for headers of streams, and
// what follows a header is measured entry by entry.
//
//     StreamSalvage salvage(file, Container::QuickTime);
//     for (const SalvagedStream& stream : salvage.run().streams)
//         std::cout << stream.header.uuid << " at " << stream.offset << ": " << stream.entries << " entries\n";

#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "../../ZULMetaData/ZULMMetaDataParser.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// A stream that was found.
struct SalvagedStream {
    /// How a stream was found, from the best way to the worst.
    enum Origin : std::int32_t {
        Reachable,   ///< a walk along the container reaches it
        Unreachable, ///< it is in a DATA atom or chunk that the walk does not reach
        Bare,        ///< only the header of the stream was found
    };

    MetaDataHeader header;                      ///< the header as it is stored
    Origin origin = Bare;                       ///< how it was found
    std::uint64_t offset = 0;                   ///< the position of the header in the file
    std::uint64_t bytes = 0;                    ///< the size of the header and the whole entries
    std::uint64_t entries = 0;                  ///< the number of whole entries
    std::optional<std::uint64_t> declaredBytes; ///< the size that the DATA around it declares

    /// Is true if declared bytes are missing, or a part of the entry after the last whole one.
    bool isCutShort = false;

    std::uint64_t end() const { return offset + bytes; } ///< returns the position after the last whole entry
};

/// The result of a search.
struct SalvageReport {
    /// The search ends at this number of streams, because a file full of headers must not fill the memory.
    static constexpr std::size_t s_maximumStreams = 10000;

    std::vector<SalvagedStream> streams; ///< sorted by kind; the best stream of a kind is first
    bool hasMore = false;                ///< is true if there may be more streams
};

/// Searches a file for streams. A stream is accepted if its kind is registered, its version is known, its entries have
/// the size of its kind, and its first entry is plausible: it is whole, fits the kind and has a time that a recording
/// can have. Streams that a walk along the container reaches are always accepted. Bytes inside a whole entry that look
/// like a header are part of that entry.
///
/// A stream ends where the next stream begins, if not before. A stream without a declared length also ends before the
/// first entry whose time is not plausible.
class ZULMETADATA_API StreamSalvage {
public:
    /// Called from time to time with the number of bytes that have been searched.
    using Progress = Callback<void(std::uint64_t done)>;

    /// If `type` is `Unknown` or `RawStream`, there is no container to walk along; a
    /// stream at the beginning of a bare stream file is reachable. Throws `std::system_error` if the size of the file
    /// cannot be determined.
    StreamSalvage(ByteSource file, Container::Type type, Progress progress = {});

    /// Searches the whole file with a few megabytes of memory. Throws `std::system_error` if the file cannot be read.
    SalvageReport run();

private:
    struct Candidate {
        SalvagedStream stream;
        std::uint64_t begin = 0; ///< of the DATA header, or of the stream's own
        bool isStream = false;
    };

    void findReachable();
    void search();
    void searchIn(std::string_view bytes, std::size_t kept, std::uint64_t offset);
    void consider(std::string_view bytes, std::string_view before, std::uint64_t offset);
    void measureAll();
    bool beginsLikeStream(const SalvagedStream& stream) const;
    bool measure(std::size_t index);
    std::uint64_t declaredEndOf(const SalvagedStream& stream) const;
    std::uint64_t limitOf(std::size_t index) const;
    void walk(SalvagedStream& stream, std::uint64_t limit) const;
    std::uint64_t nextItemIn(std::uint64_t begin, std::uint64_t end) const;
    SalvageReport report();

    ByteSource file_;
    Container::Type type_;
    Progress progress_;
    std::uint64_t total_ = 0;
    std::vector<Candidate> candidates_; ///< in the order of the file
    std::vector<Candidate> reachable_;
    bool hasMore_ = false;
};

} // namespace ZULMetaData
