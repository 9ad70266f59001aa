#include "ZULMetaDataBridge/Source/Validation/ContainerWalk.h"

#include "SharedDependencies/ZCAPHeader.h"
#include "ZULMetaData/Containers/AtomFormat.h"

#include <utility>

namespace ZULMetaData::detail {

namespace {

constexpr std::string_view s_file = "file";
constexpr std::string_view s_metaData = "ZULM";

/// Four characters; the backslash, and those that cannot be printed, by their numbers.
std::string nameOf(std::uint32_t type) {
    constexpr std::string_view digits = "0123456789abcdef";
    std::string name;
    for (int shift = 24; shift >= 0; shift -= 8) {
        const std::uint32_t byte = type >> shift & 0xff;
        if (byte >= 0x20 && byte < 0x7f && byte != '\\')
            name += static_cast<char>(byte);
        else
            name.append("\\x").append({digits[byte >> 4], digits[byte & 0xf]});
    }
    return name;
}

bool nothingFollows(std::uint64_t) {
    return false;
}

} // namespace

// ---- atoms ----

bool ContainerWalk::hasHeader(std::uint64_t end, std::string_view around) {
    static_assert(s_atomHeaderSize == s_chunkHeaderSize);
    const std::uint64_t left = end - input_.position();
    if (left < s_atomHeaderSize)
        add(FindingCode::TrailingBytes, std::string(around), input_.position(), "it ends with ", left,
            " bytes, too few for a header");
    return left >= s_atomHeaderSize;
}

bool ContainerWalk::readExtendedSize(Item& atom, std::uint64_t end, std::string_view around) {
    if (end - input_.position() < sizeof atom.size) {
        add(FindingCode::TrailingBytes, std::string(around), atom.start, "it ends inside the header of an atom ",
            nameOf(atom.type));
        return false;
    }
    atom.isMarked = atom.size == s_extendedSizeMarker;
    atom.size = input_.readBigEndian<std::uint64_t>();
    atom.headerSize = s_extendedAtomHeaderSize;
    return true;
}

/// A 32-bit size of 0 leaves the end open here; it is no announcement of an extended one.
std::optional<ContainerWalk::Item> ContainerWalk::readTopAtom() {
    Item atom{input_.position(), s_atomHeaderSize};
    if (!hasHeader(input_.total(), s_file))
        return std::nullopt;
    atom.size = input_.readBigEndian<std::uint32_t>();
    atom.type = input_.readBigEndian<std::uint32_t>();
    if (atom.size > 0 && atom.size < s_atomHeaderSize && !readExtendedSize(atom, input_.total(), s_file))
        return std::nullopt;
    return atom;
}

std::optional<ContainerWalk::Item> ContainerWalk::readChildAtom(std::uint64_t end) {
    Item atom{input_.position(), s_atomHeaderSize};
    if (!hasHeader(end, s_metaData))
        return std::nullopt;
    atom.size = input_.readBigEndian<std::uint32_t>();
    atom.type = input_.readBigEndian<std::uint32_t>();
    const bool isEmpty = atom.size == 0 && end == input_.position();
    if (atom.size < s_atomHeaderSize && !isEmpty && !readExtendedSize(atom, end, s_metaData))
        return std::nullopt;
    return atom;
}

bool ContainerWalk::hasUsableSize(const Item& atom) {
    if (!atom.isMarked)
        add(FindingCode::SizeMarker, nameOf(atom.type), atom.start,
            "the 32-bit size is neither the size of an atom nor 1, the mark of a 64-bit size");
    if (atom.size < atom.headerSize)
        add(FindingCode::SizeBelowHeader, nameOf(atom.type), atom.start, "the atom says that it has ", atom.size,
            " bytes, fewer than the ", atom.headerSize, " of its header");
    return atom.size >= atom.headerSize;
}

void ContainerWalk::reportOverrun(const Item& item) {
    const std::uint64_t left = input_.total() - item.start;
    if (item.size > left)
        add(FindingCode::BeyondFile, nameOf(item.type), item.start, "it says that it has ", item.size,
            " bytes, of which the file holds ", left);
    else
        add(FindingCode::BeyondParent, nameOf(item.type), item.start, "it says that it has ", item.size,
            " bytes, which reach beyond the end of its ZULM");
}

void ContainerWalk::reportForeignChild(const Item& child) {
    add(FindingCode::ForeignChild, nameOf(child.type), child.start, "ZULM may hold only DATA");
}

// ---- movies ----

void ContainerWalk::walkMovie() {
    while (input_.position() < input_.total()) {
        const auto atom = readTopAtom();
        if (!atom || !visitTopAtom(*atom))
            return;
        input_.moveTo(atom->start + atom->size);
    }
}

/// Whether something can follow the atom.
bool ContainerWalk::visitTopAtom(const Item& atom) {
    const bool isMetaData = atom.type == s_metaDataAtom;
    if (isMetaData)
        noteMetaData(atom);
    if (atom.size == 0) {
        add(FindingCode::OpenEndedAtom, nameOf(atom.type), atom.start,
            "the atom has no size: nothing that follows its header is found");
        if (isMetaData && atom.headerSize == s_extendedAtomHeaderSize) // an append that was interrupted
            walkMetaDataAtom({input_.total(), false, false});
        return false;
    }
    if (!hasUsableSize(atom))
        return false;
    const bool isWhole = atom.fits(input_.total());
    if (!isWhole)
        reportOverrun(atom);
    if (isMetaData)
        walkMetaDataAtom({atom.endUpTo(input_.total()), isWhole, true});
    else if (atom.type == s_recordingInfoAtom)
        checkRecordingInfo(atom);
    return isWhole;
}

void ContainerWalk::checkRecordingInfo(const Item& atom) {
    if (atom.dataSize() < sizeof(ZCAPHeader))
        add(FindingCode::ShortRecordingInfo, nameOf(atom.type), atom.start, "the atom holds ", atom.dataSize(),
            " bytes of a record of ", sizeof(ZCAPHeader));
}

void ContainerWalk::walkMetaDataAtom(Surroundings around) {
    while (input_.position() < around.end) {
        const auto child = readChildAtom(around.end);
        if (!child || !visitChildAtom(*child, around))
            return;
    }
}

/// Moves to what follows the child. False where nothing can.
bool ContainerWalk::visitChildAtom(const Item& child, Surroundings& around) {
    if (child.size == 0) {
        add(FindingCode::ZeroSizeChild, nameOf(child.type), child.start,
            "the atom has no size: nothing that follows its header is found");
        return false;
    }
    if (!hasUsableSize(child))
        return false;
    if (child.type != s_streamAtom)
        reportForeignChild(child);
    else if (walkStreamAtom(child, around))
        return true;
    if (!child.fits(around.end)) {
        reportOverrun(child);
        return false;
    }
    input_.moveTo(child.start + child.size);
    return true;
}

/// Returns true if the atom ends early, before a tail that it only counts. The position is then the true end.
bool ContainerWalk::walkStreamAtom(const Item& atom, Surroundings& around) {
    if (atom.headerSize != s_extendedAtomHeaderSize)
        add(FindingCode::ShortDataHeader, nameOf(atom.type), atom.start,
            "readers assume that every DATA header has 16 bytes, and lose the last 8 bytes of this stream");
    const auto isStreamAtom = [this, end = around.end](std::uint64_t at) { return isStreamAtomAt(at, end); };
    const StreamWalk::Outcome walked =
        walkStream(atom.dataSize(), atom.endUpTo(around.end), around.isReachable, isStreamAtom);
    if (!walked.isTailLeftOut && !endsWithoutItsTail(atom, walked.wholeEnd, around))
        return false;
    add(FindingCode::DroppedTail, nameOf(atom.type), atom.start, "the size counts ",
        atom.size - (walked.wholeEnd - atom.start),
        " bytes of a torn entry that were left out of the stream: readers do not find what follows it in the ZULM");
    around.isReachable = false;
    input_.moveTo(walked.wholeEnd);
    return true;
}

bool ContainerWalk::isStreamAtomAt(std::uint64_t position, std::uint64_t end) {
    if (end - position < s_extendedAtomHeaderSize)
        return false;
    input_.moveTo(position);
    const auto size = input_.readBigEndian<std::uint32_t>();
    return size == s_extendedSizeMarker && input_.readBigEndian<std::uint32_t>() == s_streamAtom;
}

/// The last stream of a metadata atom that was copied without its torn tail overruns it by that tail.
bool ContainerWalk::endsWithoutItsTail(const Item& atom, std::uint64_t wholeEnd, const Surroundings& around) const {
    if (!around.isWhole || atom.fits(around.end) || wholeEnd != around.end)
        return false;
    const std::uint64_t tail = atom.size - (around.end - atom.start);
    return lastEntrySize_ == 0 || tail < lastEntrySize_;
}

// ---- RIFF ----

void ContainerWalk::walkRIFF(const std::optional<WideRIFF>& wide) {
    while (input_.position() < input_.total()) {
        auto chunk = readChunk(input_.total(), s_file);
        if (!chunk)
            return;
        const bool isWide = wide && chunk->start == 0;
        if (isWide)
            chunk->size = wide->end;
        if (!visitTopChunk(*chunk))
            return;
        if (isWide)
            moveBehindWideChunk(*chunk, *wide);
        else
            moveBehindChunk(*chunk, input_.total());
    }
}

void ContainerWalk::moveBehindWideChunk(const Item& chunk, const WideRIFF& wide) {
    if (wide.isDeclared || wide.end % 2 == 0)
        moveBehindChunk(chunk, input_.total());
    else
        input_.moveTo(wide.end); // the end of the file
    if (input_.position() < input_.total())
        add(FindingCode::WideRIFF, nameOf(chunk.type), chunk.start, "its size ",
            wide.isDeclared ? "is stored in 64 bits in its ds64 chunk"
                            : "was never set, as in a file that came from a pipe",
            ": readers that use the 32-bit size find no metadata after it");
}

std::optional<ContainerWalk::Item> ContainerWalk::readChunk(std::uint64_t end, std::string_view around) {
    Item chunk{input_.position(), s_chunkHeaderSize};
    if (!hasHeader(end, around))
        return std::nullopt;
    chunk.type = chunkType(input_.read<std::uint32_t>());
    chunk.size = s_chunkHeaderSize + input_.read<std::uint32_t>();
    return chunk;
}

/// Whether something can follow the chunk.
bool ContainerWalk::visitTopChunk(const Item& chunk) {
    const bool isMetaData = chunk.type == s_metaDataAtom;
    if (isMetaData)
        noteMetaData(chunk);
    if (chunk.dataSize() == 0) {
        if (input_.position() < input_.total())
            add(FindingCode::ZeroSizeChunk, nameOf(chunk.type), chunk.start,
                "the chunk has no data: readers ignore all that follows it");
        return false;
    }
    const bool isWhole = chunk.fits(input_.total());
    if (!isWhole)
        reportOverrun(chunk);
    return (!isMetaData || walkMetaDataChunk(chunk.endUpTo(input_.total()))) && isWhole;
}

/// False where nothing can follow.
bool ContainerWalk::walkMetaDataChunk(std::uint64_t end) {
    while (input_.position() < end) {
        const auto child = readChunk(end, s_metaData);
        if (!child)
            return true;
        if (child->dataSize() == 0) {
            add(FindingCode::ZeroSizeChild, nameOf(child->type), child->start,
                "the chunk has no data: readers ignore all that follows it, in the ZULM and in the file");
            return false;
        }
        if (child->type == s_streamAtom)
            walkStream(child->dataSize(), child->endUpTo(end), true, nothingFollows);
        else
            reportForeignChild(*child);
        if (!child->fits(end)) {
            reportOverrun(*child);
            return true;
        }
        moveBehindChunk(*child, end);
    }
    return true;
}

void ContainerWalk::moveBehindChunk(const Item& chunk, std::uint64_t end) {
    const std::uint64_t dataEnd = chunk.start + chunk.size;
    const std::uint64_t pad = chunk.size % 2;
    if (pad > end - dataEnd)
        add(FindingCode::MissingPad, nameOf(chunk.type), chunk.start,
            "a chunk of odd size should be followed by a "
            "byte that makes it even");
    input_.moveTo(pad > end - dataEnd ? dataEnd : dataEnd + pad);
}

// ---- streams ----

void ContainerWalk::walkRawStream() {
    walkStream(input_.total(), input_.total(), true, nothingFollows);
}

void ContainerWalk::noteMetaData(const Item& item) {
    if (metaDataOffset_)
        add(FindingCode::SeveralMetaDataAtoms, nameOf(item.type), item.start,
            "this is not the first ZULM: an earlier one is at offset ", *metaDataOffset_);
    else
        metaDataOffset_ = item.start;
}

StreamWalk::Outcome ContainerWalk::walkStream(std::uint64_t declared, std::uint64_t end, bool isReachable,
                                              StreamWalk::IsNextStream isNextStream) {
    StreamReport stream;
    stream.declaredBytes = declared;
    stream.isReachable = isReachable;
    const auto outcome = StreamWalk(input_, log_, stream, end, report_.duration, std::move(isNextStream)).run();
    if (!isReachable)
        log_.add(stream.findings, FindingCode::UnreachableStream, stream.name(), stream.offset,
                 "readers do not find this stream, because the ZULM is damaged before it");
    else if (stream.presentBytes >= sizeof(MetaDataHeader))
        noteKind(stream);
    lastEntrySize_ = stream.fixedEntrySize;
    list(std::move(stream));
    return outcome;
}

void ContainerWalk::noteKind(StreamReport& stream) {
    if (const auto other = offsetOfKind_.find(stream.type); other != offsetOfKind_.end())
        log_.add(stream.findings, FindingCode::DuplicateStream, stream.name(), stream.offset,
                 "this stream hides an earlier stream of its kind at offset ", other->second);
    if (report_.streamCount < ValidationReport::s_maximumStreams)
        offsetOfKind_[stream.type] = stream.offset;
}

void ContainerWalk::list(StreamReport stream) {
    report_.wholeEntries += stream.wholeEntries;
    if (report_.streamCount++ < ValidationReport::s_maximumStreams)
        report_.streams.push_back(std::move(stream));
}

} // namespace ZULMetaData::detail
