#include "Tools/zulm/MetaDataTail.h"

#include "Reports/Text.h"
#include "Tools/zulm/Failure.h"
#include "Tools/zulm/OutputFile.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/RepairPlan.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include <fmt/core.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <limits>
#include <set>

namespace Zulm {

using namespace ZULMetaData;

namespace {

constexpr std::uint64_t s_most32 = std::numeric_limits<std::uint32_t>::max();

bool isBlank(const ContainerItem& item) {
    return item.type == "free" || item.type == "skip" || item.type == "JUNK";
}

bool isIndex(const ContainerItem& item) {
    return item.type == "mfra";
}

bool isOwn(const ContainerItem& item) {
    return item.holdsMetaData() || item.holdsRecordingInfo();
}

/// What may stand after the media without the media knowing its place.
bool isMovable(const ContainerItem& item) {
    return isOwn(item) || isBlank(item) || isIndex(item);
}

std::fstream openForChange(const std::string& path, const std::string& name, std::ios::openmode mode) {
    std::fstream file;
    fileOpen(file, path.c_str(), std::ios::in | std::ios::out | std::ios::binary | mode);
    if (!file.is_open())
        throw Failure(fmt::format("{}: cannot be written: {}", name, std::strerror(errno)));
    return file;
}

void requireWritten(std::fstream& file, const std::string& name) {
    file.close();
    if (!file)
        throw Failure(fmt::format("{}: cannot be written: {}", name, std::strerror(errno)));
}

void writeTo(std::ostream& file, std::string_view bytes) {
    file.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
}

std::uint64_t padded(std::uint64_t size) {
    return size + size % 2;
}

/// Calls `visit` with every piece of a source.
template <class Visit>
void inPieces(const ByteSource& source, const std::string& name, Visit visit) {
    std::string piece(static_cast<std::size_t>(std::min<std::uint64_t>(source.size(), s_copyPieceSize)), '\0');
    for (std::uint64_t done = 0; done < source.size();) {
        const std::size_t got = source.read(done, piece);
        if (got == 0)
            throw Failure(fmt::format("{}: ends earlier than before", name));
        visit(std::string_view(piece.data(), got));
        done += got;
    }
}

} // namespace

MetaDataTail::MetaDataTail(Recording& recording, KeptMetaData kept)
    : recording_(recording), kept_(kept), size_(recording.size()) {
    if (recording_.container() == Container::RawStream)
        throw Failure(fmt::format("{}: is a stream alone, without a movie around it", recording_.name()));
    items_ = topLevelItems(recording_.bytes(), recording_.container());
    requireWholeContainer();
    findTail();
    chooseCreators();
    if (kept_ == KeptMetaData::Newest) {
        requireReachableStreams();
        streams_ = recording_.streams();
    }
    streamsLeftOut_ = recording_.validation().streamCount - streams_.size();
}

bool MetaDataTail::isMovie() const {
    return recording_.container() == Container::QuickTime;
}

void MetaDataTail::requireWholeContainer() const {
    const std::string& name = recording_.name();
    const RepairPlan plan = isMovie() ? planRepair(recording_.bytes()) : RepairPlan();
    if (plan.state == RepairPlan::Repairable)
        throw Failure(
            fmt::format("{}: {}; 'zulm repair {} -o OUT' mends it first", name, plan.finding, shellWord(name)));
    const std::uint64_t end = items_.empty() ? 0 : items_.back().end();
    const bool fillsFile = end == size_ || (!isMovie() && padded(end) == size_);
    if (plan.state == RepairPlan::Unrepairable || !fillsFile)
        throw Failure(fmt::format("{}: {}; 'zulm salvage {} -o DIR' searches it for metadata streams", name,
                                  plan.finding.empty() ? "its parts do not fill the file" : plan.finding,
                                  shellWord(name)));
}

void MetaDataTail::requireReachableStreams() {
    const auto& streams = recording_.validation().streams;
    if (std::any_of(streams.begin(), streams.end(), [](const StreamReport& stream) { return !stream.isReachable; }))
        throw Failure(
            fmt::format("{}: no reader finds some of its streams, and the copy would lose them; 'zulm salvage "
                        "{} -o DIR' writes them out",
                        recording_.name(), shellWord(recording_.name())));
}

/// The tail begins with the first metadata that nothing but metadata, blanks and an index of fragments follows. A blank
/// before it is part of it if it is what was left of the index when that was moved to the end.
void MetaDataTail::findTail() {
    tail_ = items_.size();
    for (std::size_t i = items_.size(); i > 0 && isMovable(items_[i - 1]); --i)
        if (isOwn(items_[i - 1]))
            tail_ = i - 1;
    if (tail_ > 0 && tail_ < items_.size() && isBlank(items_[tail_ - 1]) && isCopyOfIndex(items_[tail_ - 1]))
        --tail_;
}

bool MetaDataTail::isCopyOfIndex(const ContainerItem& blank) const {
    if (!isIndex(items_.back()) || items_.back().size != blank.size || blank.size > s_copyPieceSize)
        return false;
    return bytesOf(blank).substr(detail::s_atomHeaderSize) == bytesOf(items_.back()).substr(detail::s_atomHeaderSize);
}

/// Of recording info that says the same the last one stays.
void MetaDataTail::chooseCreators() {
    std::set<std::string> seen;
    for (std::size_t i = items_.size(); i > tail_; --i) {
        const ContainerItem& item = items_[i - 1];
        if (isIndex(item) && std::none_of(appended_.begin(), appended_.end(), isIndex))
            appended_.push_back(item);
        if (!item.holdsRecordingInfo())
            continue;
        const bool isKept =
            kept_ == KeptMetaData::Newest && (item.size > s_copyPieceSize || seen.insert(bytesOf(item)).second);
        if (isKept)
            appended_.push_back(item);
        else
            ++creatorsLeftOut_;
    }
    std::reverse(appended_.begin(), appended_.end());
    std::stable_partition(appended_.begin(), appended_.end(), [](const auto& item) { return !isIndex(item); });
}

std::string MetaDataTail::bytesOf(const ContainerItem& item) const {
    std::string bytes;
    inPieces(recording_.bytes().part(item.offset, item.size), recording_.name(),
             [&](std::string_view piece) { bytes += piece; });
    return bytes;
}

void MetaDataTail::write(OutputFile& output, const std::string& name) {
    const std::uint64_t begin = tail_ < items_.size() ? items_[tail_].offset : size_;
    output.copyFrom(recording_.path(), 0, begin);
    const std::string& path = output.temporaryPath();
    blankEarlierMetaData(path, name);
    if (isMovie())
        attachStreams(path, name);
    else
        appendChunks(path, name);
    appendItems(path, name);
    sizeAfter_ = std::filesystem::file_size(path);
}

/// Metadata before the media leaves its place empty: the media may know the offsets of what follows.
void MetaDataTail::blankEarlierMetaData(const std::string& path, const std::string& name) const {
    std::fstream file = openForChange(path, name, {});
    for (std::size_t i = 0; i < tail_; ++i) {
        const ContainerItem& item = items_[i];
        if (!isOwn(item) || (item.holdsRecordingInfo() && kept_ == KeptMetaData::Newest))
            continue;
        file.seekp(static_cast<std::streamoff>(item.offset + (isMovie() ? sizeof item.sizeField : 0)));
        writeTo(file, isMovie() ? "free" : "JUNK");
        file.seekp(static_cast<std::streamoff>(item.payloadOffset()));
        const std::string zeros(s_copyPieceSize, '\0');
        for (std::uint64_t left = item.payloadSize(); left > 0;) {
            const std::uint64_t size = std::min<std::uint64_t>(left, zeros.size());
            writeTo(file, std::string_view(zeros).substr(0, static_cast<std::size_t>(size)));
            left -= size;
        }
    }
    requireWritten(file, name);
}

void MetaDataTail::attachStreams(const std::string& path, const std::string& name) {
    std::vector<StreamSource> sources;
    for (const StreamInfo& held : streams_)
        sources.push_back(StreamSource::bytes(recording_.bytesOf(held), recording_.name()).unchecked());
    if (sources.empty())
        return;
    try {
        const AttachResult attached = SafeMovieSave(path).attach(sources);
        for (std::size_t i = 0; i < streams_.size(); ++i)
            bytesCut_ += attached.streams[i].bytesCut + streams_[i].declaredBytes - streams_[i].presentBytes;
    } catch (const SaveError& error) {
        throw Failure(fmt::format("{}: {}", name, error.sentence()));
    }
}

void MetaDataTail::appendChunks(const std::string& path, const std::string& name) const {
    std::uint64_t size = 0;
    for (const StreamInfo& held : streams_)
        size += detail::s_chunkHeaderSize + padded(held.presentBytes);
    if (size > s_most32)
        throw Failure(fmt::format("{}: {} bytes of metadata are more than a chunk can hold", recording_.name(), size));
    std::fstream file = openForChange(path, name, std::ios::ate);
    const auto writeHeader = [&file](FourCC type, std::uint64_t length) {
        const auto header = detail::chunkHeader(type, static_cast<std::uint32_t>(length));
        writeTo(file, {header.data(), header.size()});
    };
    if (!streams_.empty())
        writeHeader(detail::s_metaDataAtom, size);
    for (const StreamInfo& held : streams_) {
        writeHeader(detail::s_streamAtom, held.presentBytes);
        inPieces(recording_.bytesOf(held), recording_.name(), [&](std::string_view piece) { writeTo(file, piece); });
        writeTo(file, std::string_view("\0", held.presentBytes % 2));
    }
    requireWritten(file, name);
}

void MetaDataTail::appendItems(const std::string& path, const std::string& name) const {
    std::fstream file = openForChange(path, name, std::ios::ate);
    for (const ContainerItem& item : appended_)
        inPieces(recording_.bytes().part(item.offset, item.size), recording_.name(),
                 [&](std::string_view piece) { writeTo(file, piece); });
    requireWritten(file, name);
}

} // namespace Zulm
