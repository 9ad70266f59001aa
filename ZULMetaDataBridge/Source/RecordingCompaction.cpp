#include "ZULMetaDataBridge/Source/RecordingCompaction.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaDataBridge/Source/MetaDataSection.h"
#include "ZULMetaDataBridge/Source/RecordingCopy.h"
#include "ZULMetaDataBridge/Source/Redaction/ContainerBytes.h"

#include <algorithm>
#include <fstream>
#include <set>
#include <span>

namespace ZULMetaData {

namespace {

using Obstacle = CompactionError::Reason;

/// Larger items are not compared with one another.
constexpr std::uint64_t s_mostCompared = 1 << 20;

bool isBlank(const ContainerItem& item) {
    return item.type == detail::s_freeAtom || item.type == "skip" || item.type == detail::s_junkChunk;
}

bool isIndex(const ContainerItem& item) {
    return item.type == detail::s_fragmentIndexAtom;
}

bool isOwn(const ContainerItem& item) {
    return item.holdsMetaData() || item.holdsRecordingInfo();
}

/// Returns whether the media does not need to know the place of the item.
bool isMovable(const ContainerItem& item) {
    return isOwn(item) || isBlank(item) || isIndex(item);
}

} // namespace

RecordingCompaction::RecordingCompaction(RecordingFile& recording, KeptMetaData kept)
    : recording_(recording), kept_(kept), items_(topLevelItems(recording.bytes(), recording.container())) {
    if (recording_.container() == Container::RawStream)
        throw CompactionError(Obstacle::NoContainer, "is a stream alone, without a movie around it");
    requireWholeContainer<CompactionError>(recording_.bytes(), recording_.container(), items_);
    findTail();
    chooseCreators();
    if (kept_ == KeptMetaData::Newest) {
        const auto& streams = recording_.validation().streams;
        if (!std::all_of(streams.begin(), streams.end(), [](const auto& stream) { return stream.isReachable; }))
            throw CompactionError(Obstacle::UnreachableStream,
                                  "no reader finds some of its streams, and the copy would lose them");
        streams_ = recording_.streams();
    }
    streamsLeftOut_ = recording_.validation().streamCount - streams_.size();
}

std::uint64_t RecordingCompaction::copiedBytes() const {
    return tail_ < items_.size() ? items_[tail_].offset : recording_.size();
}

/// The tail begins with the first metadata that nothing but metadata, blanks and an index of fragments follows. A blank
/// before it is part of it if it is what was left of the index when that was moved to the end.
void RecordingCompaction::findTail() {
    tail_ = items_.size();
    for (std::size_t i = items_.size(); i > 0 && isMovable(items_[i - 1]); --i)
        if (isOwn(items_[i - 1]))
            tail_ = i - 1;
    if (tail_ > 0 && tail_ < items_.size() && isBlank(items_[tail_ - 1]) && isCopyOfIndex(items_[tail_ - 1]))
        --tail_;
}

bool RecordingCompaction::isCopyOfIndex(const ContainerItem& blank) const {
    const ContainerItem& index = items_.back();
    if (!isIndex(index) || index.size != blank.size || blank.size > s_mostCompared)
        return false;
    return detail::readAll(bytesOf(blank).part(detail::s_atomHeaderSize)) ==
           detail::readAll(bytesOf(index).part(detail::s_atomHeaderSize));
}

/// The last one stays of recording info that says the same.
void RecordingCompaction::chooseCreators() {
    std::set<std::string> seen;
    std::vector<ContainerItem> indexes;
    for (std::size_t i = items_.size(); i > tail_; --i) {
        const ContainerItem& item = items_[i - 1];
        if (isIndex(item) && indexes.empty())
            indexes.push_back(item);
        if (!item.holdsRecordingInfo())
            continue;
        const bool isNew = item.size > s_mostCompared || seen.insert(detail::readAll(bytesOf(item))).second;
        if (kept_ != KeptMetaData::Nothing && isNew)
            appended_.insert(appended_.begin(), item);
        else
            ++creatorsLeftOut_;
    }
    appended_.insert(appended_.end(), indexes.begin(), indexes.end());
}

void RecordingCompaction::complete(const FileLocation& copy) {
    std::fstream out;
    fileOpen(out, utf8Path(copy).c_str(), std::ios::in | std::ios::out | std::ios::binary);
    if (!out.is_open())
        failToWrite<CompactionError>();
    blankEarlierMetaData(out);
    out.seekp(static_cast<std::streamoff>(copiedBytes()));
    writeStreams(out);
    for (const ContainerItem& item : appended_)
        appendBytes(bytesOf(item), 0, item.size, out);
    sizeAfter_ = finishCopy<CompactionError>(out, copy);
    verify(copy);
}

/// Metadata before the media leaves its place empty: the media may know the offsets of what follows.
void RecordingCompaction::blankEarlierMetaData(std::ostream& out) const {
    const std::string zeros(s_mostCompared, '\0');
    for (const ContainerItem& item : std::span(items_).first(tail_)) {
        if (!isOwn(item) || (item.holdsRecordingInfo() && kept_ != KeptMetaData::Nothing))
            continue;
        out.seekp(static_cast<std::streamoff>(item.offset + (isMovie() ? sizeof item.sizeField : 0)));
        out << (isMovie() ? detail::s_freeAtom : detail::s_junkChunk).text();
        out.seekp(static_cast<std::streamoff>(item.payloadOffset()));
        for (std::uint64_t left = item.payloadSize(); left > 0; left -= std::min<std::uint64_t>(left, zeros.size()))
            out.write(zeros.data(), static_cast<std::streamsize>(std::min<std::uint64_t>(left, zeros.size())));
    }
}

void RecordingCompaction::writeStreams(std::ostream& out) {
    try {
        MetaDataSection section(out, recording_.container());
        for (const StreamInfo& stream : streams_)
            section.add([&](std::ostream& output) {
                const ByteSource whole = wholePartOf(stream);
                appendBytes(whole, 0, whole.size(), output);
                bytesCut_ += stream.declaredBytes - whole.size();
                return true;
            });
        section.finish();
    } catch (const std::length_error& error) {
        throw CompactionError(Obstacle::TooLarge, error.what());
    }
}

/// Returns the stream without an entry that is incomplete at its end.
ByteSource RecordingCompaction::wholePartOf(const StreamInfo& stream) const {
    const ByteSource bytes = recording_.bytesOf(stream);
    const auto extent = measureStream(bytes);
    const bool isTorn = extent && extent->end == StreamExtent::InsideEntry &&
                        extent->header.fixedEntrySize == entrySizeOf(extent->header);
    return isTorn ? bytes.part(0, extent->wholeBytes) : bytes;
}

/// Reads the copy back: its readers must find the same streams with the same bytes.
void RecordingCompaction::verify(const FileLocation& copy) const {
    const RecordingFile written(copy);
    const std::vector<StreamInfo> found = written.streams();
    bool isSame = found.size() == streams_.size();
    for (std::size_t i = 0; isSame && i < found.size(); ++i)
        isSame = found[i].type == streams_[i].type && !found[i].isCutShort() &&
                 haveSameBytes(written.bytesOf(found[i]), wholePartOf(streams_[i]));
    if (!isSame)
        throw CompactionError(Obstacle::CannotWrite, "does not hold what was written");
}

} // namespace ZULMetaData
