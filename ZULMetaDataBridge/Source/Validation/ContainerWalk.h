#pragma once

// Validates a container around its streams: that every header makes sense and that the items fill the file.

#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaDataBridge/Source/Validation/FindingLog.h"
#include "ZULMetaDataBridge/Source/Validation/MetaDataValidator.h"
#include "ZULMetaDataBridge/Source/Validation/StreamWalk.h"

#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>

namespace ZULMetaData::detail {

class ContainerWalk {
public:
    /// The report and the ignored codes must outlive the walk. Findings of the ignored codes are not made.
    ContainerWalk(const ByteSource& file, ValidationReport& report, const std::set<FindingCode>& ignored)
        : file_(file), items_(file, report.container), report_(report), log_(report, ignored) {}

    void walkMovie();
    void walkRIFF();
    void walkRawStream();

private:
    /// What is around the streams of a metadata atom.
    struct Surroundings {
        bool isWhole;     ///< whether the atom lies inside the file
        bool isReachable; ///< whether readers find what follows
    };

    /// What the walk along a container can do after an item.
    enum class Next { GoesOn, Stops };

    template <class... Parts>
    void add(FindingCode code, const std::string& place, std::uint64_t offset, const Parts&... parts) {
        log_.add(report_.findings, code, place, offset, parts...);
    }

    std::optional<ContainerItem> nextItem(ItemWalk& items, const std::string& around);
    Next checkSize(const ContainerItem& atom);
    void reportOverrun(const ContainerItem& item);
    void reportForeignChild(const ContainerItem& child);
    void checkPad(const ContainerItem& chunk, const ItemWalk& chunks);
    void checkWidth(const ContainerItem& chunk);

    Next visitTopAtom(const ContainerItem& atom);
    void checkRecordingInfo(const ContainerItem& atom);
    void walkMetaDataAtom(ItemWalk children, Surroundings around);
    Next visitChildAtom(const ContainerItem& child, ItemWalk& children, Surroundings& around);
    std::optional<std::uint64_t> walkStreamAtom(const ContainerItem& atom, const ItemWalk& children,
                                                const Surroundings& around);
    bool endsWithoutItsTail(const ContainerItem& atom, std::uint64_t wholeEnd, std::uint64_t end) const;

    Next visitTopChunk(const ContainerItem& chunk);
    Next walkMetaDataChunk(ItemWalk children);

    void noteMetaData(const ContainerItem& item);
    StreamWalk::Outcome walkStream(std::uint64_t offset, std::uint64_t declared, std::uint64_t end, bool isReachable,
                                   StreamWalk::IsNextStream isNextStream);
    void noteKind(StreamReport& stream);
    void list(StreamReport stream);

    ByteSource file_;
    ItemWalk items_;
    ValidationReport& report_;
    FindingLog log_;
    std::map<uuid, std::uint64_t> offsetOfKind_; ///< of the listed streams that readers reach
    std::optional<std::uint64_t> metaDataOffset_;
    std::uint32_t lastEntrySize_ = 0; ///< in the header of the stream that was walked last
};

} // namespace ZULMetaData::detail
