#pragma once

// Finds metadata streams that a walk of the container cannot reach: behind a broken or mis-sized atom, in a file that
// was cut short, or without any container around them. The bytes of the file are searched for the headers of streams;
// what follows one is measured entry by entry.
//
//     StreamSalvage salvage(file, MetaDataParser::QuickTime);
//     for (const SalvagedStream& stream : salvage.run().streams)
//         std::cout << stream.header.uuid << " at " << stream.offset << ": " << stream.entries << " entries\n";

#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "../../ZULMetaData/ZULMMetaDataParser.h"

#include <cstddef>
#include <cstdint>
#include <istream>
#include <optional>
#include <string_view>
#include <vector>

namespace ZULMetaData {

/// A stream that was found, and how much of it is whole.
struct SalvagedStream {
    /// How it was found, from the best to the worst.
    enum Origin : std::int32_t {
        Reachable,   ///< a walk of the container gets to it
        Unreachable, ///< in a DATA atom or chunk that the walk does not get to
        Bare,        ///< only the stream's own header was found
    };

    MetaDataHeader header;                      ///< as it stands in the file
    Origin origin = Bare;                       ///< how it was found
    std::uint64_t offset = 0;                   ///< of its header in the file
    std::uint64_t bytes = 0;                    ///< header and whole entries
    std::uint64_t entries = 0;                  ///< whole ones
    std::optional<std::uint64_t> declaredBytes; ///< by the DATA around it

    /// Whether something of what is declared, or of the entry behind the last whole one, is lost.
    bool isCutShort = false;

    std::uint64_t end() const { return offset + bytes; } ///< behind the last whole entry, in the file
};

/// What was found.
struct SalvageReport {
    /// More are not looked for: a file full of headers must not fill the memory.
    static constexpr std::size_t s_maximumStreams = 10000;

    std::vector<SalvagedStream> streams; ///< in the order of their kinds, of each kind the best first
    bool hasMore = false;                ///< whether what may be headers of further streams was passed over
};

/// A stream counts where its kind is registered, its version is known, the size of its entries is that of its kind,
/// and its first entry makes sense: it is whole, fits its kind and has a time that a recording can have. Streams that
/// the walk reaches count whatever they are. What looks like a header inside a whole entry is part of that entry.
///
/// Every stream ends at the latest where the next one begins; one without a declared length also at the first entry
/// whose time makes no sense.
class ZULMETADATA_API StreamSalvage {
public:
    /// Called now and then with how many bytes have been searched.
    using Progress = Callback<void(std::uint64_t done)>;

    /// `file` is the caller's and must outlive this. Of the type `Unknown` or `RawStream` nothing is walked, but what a
    /// bare stream file begins with is reachable. Throws `std::system_error` where the file has no size.
    StreamSalvage(std::istream& file, MetaDataParser::StreamType type, Progress progress = {});

    /// Searches the whole file, in a few megabytes of memory. Throws `std::system_error` where it cannot be read.
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

    ReadBytes read_;
    std::istream& file_;
    MetaDataParser::StreamType type_;
    Progress progress_;
    std::uint64_t total_ = 0;
    std::vector<Candidate> candidates_; ///< in the order of the file
    std::vector<Candidate> reachable_;
    bool hasMore_ = false;
};

} // namespace ZULMetaData
