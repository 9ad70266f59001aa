#pragma once

// Validates a container around its streams: that every header makes sense and that the items fill the file.

#include "ZULMetaData/Containers/WideRIFF.h"
#include "ZULMetaDataBridge/Source/Validation/FindingLog.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"
#include "ZULMetaDataBridge/Source/Validation/StreamWalk.h"
#include "ZULMetaDataBridge/Source/Validation/UntrustedInput.h"

#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <string_view>

namespace ZULMetaData::detail {

class ContainerWalk {
public:
    /// All must outlive the walk. Findings of the ignored codes are not made.
    ContainerWalk(UntrustedInput& input, ValidationReport& report, const std::set<FindingCode>& ignored)
        : input_(input), report_(report), log_(report, ignored) {}

    void walkMovie();
    void walkRIFF(const std::optional<WideRIFF>& wide);
    void walkRawStream();

private:
    /// An atom or a chunk.
    struct Item {
        std::uint64_t start = 0;
        std::uint64_t headerSize = 0;
        std::uint64_t size = 0; ///< header included, as declared
        std::uint32_t type = 0; ///< as `fourCC` gives it
        bool isMarked = true;   ///< false where a 32-bit size announces the extended one without being its mark

        std::uint64_t dataSize() const { return size - headerSize; }
        bool fits(std::uint64_t limit) const { return size <= limit - start; }
        std::uint64_t endUpTo(std::uint64_t limit) const { return fits(limit) ? start + size : limit; }
    };

    /// What is around the streams of a metadata atom.
    struct Surroundings {
        std::uint64_t end;
        bool isWhole;     ///< whether that is the atom's own end, and not the file's
        bool isReachable; ///< whether readers get to what follows
    };

    template <class... Parts>
    void add(FindingCode code, const std::string& place, std::uint64_t offset, const Parts&... parts) {
        log_.add(report_.findings, code, place, offset, parts...);
    }

    std::optional<Item> readTopAtom();
    std::optional<Item> readChildAtom(std::uint64_t end);
    bool readExtendedSize(Item& atom, std::uint64_t end, std::string_view around);
    bool hasHeader(std::uint64_t end, std::string_view around);
    bool hasUsableSize(const Item& atom);
    void reportOverrun(const Item& item);
    void reportForeignChild(const Item& child);

    bool visitTopAtom(const Item& atom);
    void checkRecordingInfo(const Item& atom);
    void walkMetaDataAtom(Surroundings around);
    bool visitChildAtom(const Item& child, Surroundings& around);
    bool walkStreamAtom(const Item& atom, Surroundings& around);
    bool isStreamAtomAt(std::uint64_t position, std::uint64_t end);
    bool endsWithoutItsTail(const Item& atom, std::uint64_t wholeEnd, const Surroundings& around) const;

    std::optional<Item> readChunk(std::uint64_t end, std::string_view around);
    bool visitTopChunk(const Item& chunk);
    bool walkMetaDataChunk(std::uint64_t end);
    void moveBehindWideChunk(const Item& chunk, const WideRIFF& wide);
    void moveBehindChunk(const Item& chunk, std::uint64_t end);

    void noteMetaData(const Item& item);
    StreamWalk::Outcome walkStream(std::uint64_t declared, std::uint64_t end, bool isReachable,
                                   StreamWalk::IsNextStream isNextStream);
    void noteKind(StreamReport& stream);
    void list(StreamReport stream);

    UntrustedInput& input_;
    ValidationReport& report_;
    FindingLog log_;
    std::map<uuid, std::uint64_t> offsetOfKind_; ///< of the listed streams that readers reach
    std::optional<std::uint64_t> metaDataOffset_;
    std::uint32_t lastEntrySize_ = 0; ///< in the header of the stream that was walked last
};

} // namespace ZULMetaData::detail
