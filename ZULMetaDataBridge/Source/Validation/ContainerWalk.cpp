#include "ZULMetaDataBridge/Source/Validation/ContainerWalk.h"

#include "SharedDependencies/ZCAPHeader.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaDataBridge/Source/Validation/StreamWalk.h"

#include <algorithm>
#include <map>
#include <stdexcept>
#include <string_view>
#include <utility>

namespace ZULMetaData::detail {

namespace {

/// Returns the four characters; the backslash, and those that cannot be printed, by their numbers.
std::string nameOf(FourCC type) {
    constexpr std::string_view digits = "0123456789abcdef";
    std::string name;
    for (const char character : type.text()) {
        const auto byte = static_cast<unsigned char>(character);
        if (byte >= 0x20 && byte < 0x7f && byte != '\\')
            name += character;
        else
            name.append("\\x").append({digits[byte >> 4], digits[byte & 0xf]});
    }
    return name;
}

bool nothingFollows(std::uint64_t) {
    return false;
}

class ContainerWalk {
public:
    ContainerWalk(const ByteSource& file, ValidationReport& report, const std::set<FindingCode>& ignored)
        : file_(file), items_(file, report.container), report_(report), log_(report, ignored) {}

    void run() {
        switch (report_.container) {
        case Container::QuickTime: return walkMovie();
        case Container::Riff: return walkRIFF();
        case Container::RawStream: return void(walkStream(0, file_.size(), file_.size(), true, nothingFollows));
        default: throw std::runtime_error(RecognizedContainer().refusal());
        }
    }

private:
    void walkMovie() {
        for (auto atom = nextItem(items_, "file"); atom; atom = nextItem(items_, "file"))
            if (visitTopAtom(*atom) == Next::Stops)
                return;
    }

    void walkRIFF() {
        for (auto chunk = nextItem(items_, "file"); chunk; chunk = nextItem(items_, "file")) {
            if (visitTopChunk(*chunk) == Next::Stops)
                return;
            if (chunk->sizeSource != ContainerItem::FileEnd)
                checkPad(*chunk, items_);
            if (chunk->sizeSource != ContainerItem::Header)
                checkWidth(*chunk);
        }
    }

    /// What is around the streams of a metadata atom.
    struct Surroundings {
        bool isWhole;     ///< whether the atom lies inside the file
        bool isReachable; ///< whether readers find what follows
    };

    /// What the walk along a container can do after an item.
    enum class Next { GoesOn, Stops };

    template <class... Parts>
    void add(FindingCode code, const ContainerItem& item, const Parts&... parts) {
        log_.add(report_.findings, code, nameOf(item.type), item.offset, parts...);
    }

    std::optional<ContainerItem> nextItem(ItemWalk& items, const std::string& around) {
        const std::uint64_t position = items.position();
        auto item = items.next();
        if (!item && position < items.end())
            log_.add(report_.findings, FindingCode::TrailingBytes, around, position, "it ends with ",
                     items.end() - position, " bytes, too few for a header");
        return item;
    }

    Next checkSize(const ContainerItem& atom) {
        if (atom.isExtended() && atom.sizeField != s_extendedSizeMarker)
            add(FindingCode::SizeMarker, atom,
                "the 32-bit size is neither the size of an atom nor 1, the mark of a 64-bit size");
        if (atom.size >= atom.headerSize)
            return Next::GoesOn;
        add(FindingCode::SizeBelowHeader, atom, "the atom says that it has ", atom.size, " bytes, fewer than the ",
            atom.headerSize, " of its header");
        return Next::Stops;
    }

    void reportOverrun(const ContainerItem& item) {
        if (!item.fits(file_.size()))
            add(FindingCode::BeyondFile, item, "it says that it has ", item.size, " bytes, of which the file holds ",
                file_.size() - item.offset);
        else
            add(FindingCode::BeyondParent, item, "it says that it has ", item.size,
                " bytes, which reach beyond the end of its ZULM");
    }

    void reportForeignChild(const ContainerItem& child) {
        add(FindingCode::ForeignChild, child, "ZULM may hold only DATA");
    }

    void checkPad(const ContainerItem& chunk, const ItemWalk& chunks) {
        if (chunk.size % 2 != 0 && chunk.end() == chunks.end())
            add(FindingCode::MissingPad, chunk, "a chunk of odd size should be followed by a byte that makes it even");
    }

    void checkWidth(const ContainerItem& chunk) {
        if (items_.position() < file_.size())
            add(FindingCode::WideRIFF, chunk, "its size ",
                chunk.sizeSource == ContainerItem::SizeChunk ? "is stored in 64 bits in its ds64 chunk"
                                                             : "was never set, as in a file that came from a pipe",
                ": readers that use the 32-bit size find no metadata after it");
    }

    /// A 32-bit size of 0 leaves the end open at the top of a movie; it does not announce a 64-bit size.
    Next visitTopAtom(const ContainerItem& atom) {
        if (atom.holdsMetaData())
            noteMetaData(atom);
        if (atom.sizeField == 0 || atom.size == 0) {
            add(FindingCode::OpenEndedAtom, atom, "the atom has no size: nothing that follows its header is found");
            if (atom.holdsMetaData() && atom.sizeField != 0) { // an append that was interrupted
                ItemWalk children = items_;
                children.moveTo(atom.payloadOffset());
                walkMetaDataAtom(std::move(children), {false, false});
            }
            return Next::Stops;
        }
        if (checkSize(atom) == Next::Stops)
            return Next::Stops;
        const bool isWhole = atom.fits(file_.size());
        if (!isWhole)
            reportOverrun(atom);
        if (atom.holdsMetaData())
            walkMetaDataAtom(items_.inside(atom), {isWhole, true});
        else if (atom.holdsRecordingInfo())
            checkRecordingInfo(atom);
        return isWhole ? Next::GoesOn : Next::Stops;
    }

    void checkRecordingInfo(const ContainerItem& atom) {
        if (atom.payloadSize() < sizeof(ZCAPHeader))
            add(FindingCode::ShortRecordingInfo, atom, "the atom holds ", atom.payloadSize(), " bytes of a record of ",
                sizeof(ZCAPHeader));
    }

    void walkMetaDataAtom(ItemWalk children, Surroundings around) {
        for (auto child = nextItem(children, s_metaDataAtom.text()); child;
             child = nextItem(children, s_metaDataAtom.text()))
            if (visitChildAtom(*child, children, around) == Next::Stops)
                return;
    }

    Next visitChildAtom(const ContainerItem& child, ItemWalk& children, Surroundings& around) {
        if (child.size == 0) {
            add(FindingCode::ZeroSizeChild, child, "the atom has no size: nothing that follows its header is found");
            return Next::Stops;
        }
        if (checkSize(child) == Next::Stops)
            return Next::Stops;
        if (!child.holdsStream()) {
            reportForeignChild(child);
        } else if (const auto end = walkStreamAtom(child, children, around)) {
            around.isReachable = false;
            children.moveTo(*end);
            return Next::GoesOn;
        }
        if (child.fits(children.end()))
            return Next::GoesOn;
        reportOverrun(child);
        return Next::Stops;
    }

    /// Returns the true end of an atom whose size counts a tail that was never written.
    std::optional<std::uint64_t> walkStreamAtom(const ContainerItem& atom, const ItemWalk& children,
                                                const Surroundings& around) {
        if (!atom.isExtended())
            add(FindingCode::ShortDataHeader, atom,
                "readers assume that every DATA header has 16 bytes, and lose the last 8 bytes of this stream");
        const auto isStreamAtom = [&children](std::uint64_t position) {
            const auto next = children.itemAt(position);
            return next && next->sizeField == s_extendedSizeMarker && next->holdsStream();
        };
        const std::uint64_t end = atom.fits(children.end()) ? atom.end() : children.end();
        const auto walked = walkStream(atom.payloadOffset(), atom.payloadSize(), end, around.isReachable, isStreamAtom);
        const bool lacksItsTail = around.isWhole && endsWithoutItsTail(atom, walked.wholeEnd, children.end());
        if (!walked.isTailLeftOut && !lacksItsTail)
            return std::nullopt;
        add(FindingCode::DroppedTail, atom, "the size counts ", atom.size - (walked.wholeEnd - atom.offset),
            " bytes of a torn entry that were left out of the stream: readers do not find what follows it in the ZULM");
        return walked.wholeEnd;
    }

    /// Returns whether the last stream of a metadata atom was copied without its torn tail, and overruns the atom by
    /// that tail.
    bool endsWithoutItsTail(const ContainerItem& atom, std::uint64_t wholeEnd, std::uint64_t end) const {
        if (atom.fits(end) || wholeEnd != end)
            return false;
        const std::uint64_t tail = atom.size - (end - atom.offset);
        return lastEntrySize_ == 0 || tail < lastEntrySize_;
    }

    Next visitTopChunk(const ContainerItem& chunk) {
        if (chunk.holdsMetaData())
            noteMetaData(chunk);
        if (chunk.payloadSize() == 0) {
            if (chunk.payloadOffset() < file_.size())
                add(FindingCode::ZeroSizeChunk, chunk, "the chunk has no data: readers ignore all that follows it");
            return Next::Stops;
        }
        const bool isWhole = chunk.fits(file_.size());
        if (!isWhole)
            reportOverrun(chunk);
        const Next next = chunk.holdsMetaData() ? walkMetaDataChunk(items_.inside(chunk)) : Next::GoesOn;
        return isWhole ? next : Next::Stops;
    }

    Next walkMetaDataChunk(ItemWalk children) {
        for (auto child = nextItem(children, s_metaDataAtom.text()); child;
             child = nextItem(children, s_metaDataAtom.text())) {
            if (child->payloadSize() == 0) {
                add(FindingCode::ZeroSizeChild, *child,
                    "the chunk has no data: readers ignore all that follows it, in the ZULM and in the file");
                return Next::Stops;
            }
            const bool fits = child->fits(children.end());
            const std::uint64_t end = fits ? child->end() : children.end();
            if (child->holdsStream())
                walkStream(child->payloadOffset(), child->payloadSize(), end, true, nothingFollows);
            else
                reportForeignChild(*child);
            if (!fits) {
                reportOverrun(*child);
                return Next::GoesOn;
            }
            checkPad(*child, children);
        }
        return Next::GoesOn;
    }

    void noteMetaData(const ContainerItem& item) {
        if (metaDataOffset_)
            add(FindingCode::SeveralMetaDataAtoms, item, "this is not the first ZULM: an earlier one is at offset ",
                *metaDataOffset_);
        else
            metaDataOffset_ = item.offset;
    }

    WalkedStream walkStream(std::uint64_t offset, std::uint64_t declared, std::uint64_t end, bool isReachable,
                            IsNextStream isNextStream) {
        StreamReport stream;
        stream.offset = offset;
        stream.declaredBytes = declared;
        stream.isReachable = isReachable;
        const std::uint64_t begin = std::min(offset, end);
        const WalkedStream walked = detail::walkStream(file_.part(begin, end - begin), file_.size(), report_.duration,
                                                       log_, stream, std::move(isNextStream));
        if (!isReachable)
            log_.add(stream.findings, FindingCode::UnreachableStream, stream.name(), stream.offset,
                     "readers do not find this stream, because the ZULM is damaged before it");
        else if (stream.presentBytes >= sizeof(MetaDataHeader))
            noteKind(stream);
        lastEntrySize_ = stream.fixedEntrySize;
        list(std::move(stream));
        return walked;
    }

    void noteKind(StreamReport& stream) {
        if (const auto other = offsetOfKind_.find(stream.type); other != offsetOfKind_.end())
            log_.add(stream.findings, FindingCode::DuplicateStream, stream.name(), stream.offset,
                     "this stream hides an earlier stream of its kind at offset ", other->second);
        if (report_.streamCount < ValidationReport::s_maximumStreams)
            offsetOfKind_[stream.type] = stream.offset;
    }

    void list(StreamReport stream) {
        report_.wholeEntries += stream.wholeEntries;
        if (report_.streamCount++ < ValidationReport::s_maximumStreams)
            report_.streams.push_back(std::move(stream));
    }

    ByteSource file_;
    ItemWalk items_;
    ValidationReport& report_;
    FindingLog log_;
    std::map<uuid, std::uint64_t> offsetOfKind_; ///< of the listed streams that readers reach
    std::optional<std::uint64_t> metaDataOffset_;
    std::uint32_t lastEntrySize_ = 0; ///< in the header of the stream that was walked last
};

} // namespace

void walkContainer(const ByteSource& file, ValidationReport& report, const std::set<FindingCode>& ignored) {
    ContainerWalk(file, report, ignored).run();
}

} // namespace ZULMetaData::detail
