#include "Tools/zulm/RedactedCopy.h"

#include "Tools/zulm/OutputFile.h"
#include "Tools/zulm/Progress.h"
#include "Tools/zulm/TemporaryFile.h"
#include "Tools/zulm/Text.h"
#include "ZULMetaData/AtomFormat.h"

#include <fmt/core.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <limits>

namespace Zulm {

using namespace ZULMetaData;

namespace {

constexpr std::uint64_t s_most32 = std::numeric_limits<std::uint32_t>::max();

/// Of at least one byte. The bytes are compared with themselves, one further on.
bool isZero(const std::vector<char>& bytes, std::size_t size) {
    return bytes.front() == 0 && std::memcmp(bytes.data(), bytes.data() + 1, size - 1) == 0;
}

/// Appends a part of a file. What is zero is skipped, so that holes stay holes.
void copyBytes(const ReadBytes& read, const std::string& name, std::uint64_t offset, std::uint64_t size,
               std::ostream& output, Progress& progress) {
    std::vector<char> piece(s_copyPieceSize);
    for (std::uint64_t left = size; left > 0;) {
        const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(left, piece.size()));
        const std::size_t got = read(offset + size - left, {piece.data(), wanted});
        if (got == 0)
            throw Failure(fmt::format("{}: cannot be read at offset {}", name, offset + size - left));
        if (isZero(piece, got))
            output.seekp(static_cast<std::streamoff>(got), std::ios::cur);
        else
            output.write(piece.data(), static_cast<std::streamsize>(got));
        left -= got;
        progress.advance(got);
    }
}

template <std::size_t size>
void writeBytes(std::ostream& output, const std::array<char, size>& bytes) {
    output.write(bytes.data(), static_cast<std::streamsize>(size));
}

[[noreturn]] void failToWrite(const std::string& name) {
    throw Failure(fmt::format("{}: cannot be written: {}", name, std::strerror(errno)));
}

/// How much has been written or skipped. A stream does not call itself failed where it cannot tell, and what is put
/// behind that would stand in the wrong place.
std::uint64_t sizeOf(std::ostream& output, const std::string& name) {
    const auto end = output.tellp();
    if (end < 0)
        failToWrite(name);
    return static_cast<std::uint64_t>(end);
}

/// The file ends where it was written or skipped to.
void finish(std::ofstream& output, const std::string& path, const std::string& name) {
    const std::uint64_t end = sizeOf(output, name);
    output.close();
    if (!output)
        failToWrite(name);
    std::filesystem::resize_file(path, end);
}

std::uint64_t padded(std::uint64_t size) {
    return size + size % 2;
}

} // namespace

RedactedCopy::RedactedCopy(Recording& recording, const Redaction& redaction)
    : recording_(recording), redaction_(redaction) {
    total_ = recording_.size();
    items_ = listTopLevel(recording_.parser().getStream(), container());
    requireRead(recording_.parser().getStream(), recording_.name());
    if (container() == MetaDataParser::RawStream)
        return;
    requireWholeContainer();
    requireNothingHidden();
}

void RedactedCopy::requireWholeContainer() {
    const std::string& name = recording_.name();
    const bool isMovie = container() == MetaDataParser::QuickTime;
    const RepairPlan plan =
        orUnreadable(name, [&] { return isMovie ? planRepair(recording_.parser().getStream()) : RepairPlan(); });
    if (plan.state == RepairPlan::Repairable)
        throw Failure(
            fmt::format("{}: {}; 'zulm repair {} -o OUT' mends it first", name, plan.finding, shellWord(name)));
    const std::uint64_t end = items_.empty() ? 0 : items_.back().end();
    const bool fillsFile = end == total_ || (!isMovie && padded(end) == total_);
    if (plan.state == RepairPlan::Unrepairable || !fillsFile)
        throw Failure(fmt::format("{}: {}; 'zulm salvage {} -o DIR' writes out its streams, which can be redacted one "
                                  "by one",
                                  name, plan.finding.empty() ? "its parts do not fill the file" : plan.finding,
                                  shellWord(name)));
}

/// Metadata in a place that is copied as it is would stay in the copy.
void RedactedCopy::requireNothingHidden() {
    Progress progress("searching " + recording_.name(), total_);
    const SalvageReport report = orUnreadable(recording_.name(), [&] {
        return StreamSalvage(recording_.parser().getStream(), container(),
                             [&progress](std::uint64_t done) { progress.moveTo(done); })
            .run();
    });
    if (report.hasMore)
        throw Failure(fmt::format("{}: has more than {} places that look like streams; not all could be looked into",
                                  recording_.name(), SalvageReport::s_maximumStreams));
    for (const SalvagedStream& stream : report.streams) {
        if (isKept(stream.offset))
            throw Failure(fmt::format("{}: {} at offset {} is outside of the metadata and would stay in the copy; "
                                      "'zulm salvage {} -o DIR' shows what it is",
                                      recording_.name(), metaDataKindName(stream.header.uuid), stream.offset,
                                      shellWord(recording_.name())));
        unreachable_ += stream.origin == SalvagedStream::Reachable ? 0 : 1;
    }
}

bool RedactedCopy::isKept(std::uint64_t offset) const {
    return std::none_of(items_.begin(), items_.end(), [offset](const ContainerItem& item) {
        return item.holdsMetaData() && item.offset <= offset && offset < item.end();
    });
}

/// Whether something stands behind it whose place may be known to the media.
bool RedactedCopy::isBeforeMedia(std::size_t item) const {
    return std::any_of(items_.begin() + static_cast<std::ptrdiff_t>(item), items_.end(),
                       [](const auto& next) { return !next.holdsMetaData() && !next.holdsRecordingInfo(); });
}

void RedactedCopy::write(const std::string& path, const std::string& name) {
    name_ = name;
    const std::string folder = std::filesystem::path(path).parent_path().string();
    const TemporaryFile streams(folder.empty() ? "." : folder, "streams", ".dat");
    writeStreams(container() == MetaDataParser::RawStream ? path : streams.path());
    if (container() == MetaDataParser::QuickTime)
        writeMovie(path, streams.path());
    if (container() == MetaDataParser::Riff)
        writeRIFF(path, streams.path());
}

/// A text that one stream makes a secret is hidden in every stream.
Redaction RedactedCopy::redactionOfAllStreams() {
    RedactedTexts texts;
    for (const HeldStream& held : heldStreams(recording_))
        orUnreadable(recording_.name(), [&] {
            collectRedactedTexts(StreamSource::part(recording_.path(), held.offset, held.present).open(), redaction_,
                                 texts);
        });
    Redaction redaction = redaction_;
    redaction.hidesText = [texts = std::move(texts.hidden), &given = redaction_.hidesText](const std::string& text) {
        return texts.contains(text) || (given && given(text));
    };
    if (redaction_.removedTimes.empty() && !redaction_.hidesText)
        redaction.hidesText = nullptr; // then streams that cannot be looked into may stay
    return redaction;
}

void RedactedCopy::writeStreams(const std::string& file) {
    const Redaction redaction = redactionOfAllStreams();
    std::ofstream output = openOutput(file, name_);
    for (const HeldStream& held : heldStreams(recording_)) {
        const std::uint64_t begin = sizeOf(output, name_);
        const StreamSource source = StreamSource::part(recording_.path(), held.offset, held.present);
        RedactedStream stream =
            orUnreadable(recording_.name(), [&] { return redactStream(source.open(), redaction, output); });
        stream.bytesLeftOut += held.declared - held.present;
        stream.header.uuid = held.type;
        streams_.push_back(stream);
        if (stream.removal == RedactedStream::Kept)
            parts_.push_back({begin, sizeOf(output, name_) - begin});
    }
    finish(output, file, name_);
}

void RedactedCopy::writeMovie(const std::string& output, const std::string& streamFile) const {
    std::ofstream file = openOutput(output, name_);
    writeItems(file);
    finish(file, output, name_);
    std::vector<StreamSource> sources;
    for (const Part& part : parts_)
        sources.push_back(StreamSource::part(streamFile, part.offset, part.size));
    try {
        if (!sources.empty())
            SafeMovieSave(output).attach(sources);
    } catch (const SaveError& error) {
        throw Failure(fmt::format("{}: {}", name_, error.sentence()));
    }
}

void RedactedCopy::writeRIFF(const std::string& output, const std::string& streamFile) const {
    std::uint64_t size = 0;
    for (const Part& part : parts_)
        size += detail::s_chunkHeaderSize + padded(part.size);
    if (size > s_most32)
        throw Failure(fmt::format("{}: {} bytes of metadata are more than a chunk can hold", recording_.name(), size));
    std::ofstream file = openOutput(output, name_);
    writeItems(file);
    std::ifstream streams = openInput(streamFile);
    Progress progress("writing the metadata", size);
    if (!parts_.empty())
        writeBytes(file, detail::chunkHeader(detail::s_metaDataAtom, static_cast<std::uint32_t>(size)));
    for (const Part& part : parts_) {
        writeBytes(file, detail::chunkHeader(detail::s_streamAtom, static_cast<std::uint32_t>(part.size)));
        orUnreadable(streamFile,
                     [&] { copyBytes(readingFrom(streams), streamFile, part.offset, part.size, file, progress); });
        file.seekp(static_cast<std::streamoff>(part.size % 2), std::ios::cur);
    }
    finish(file, output, name_);
}

/// All but the metadata, which leaves unused bytes where its place may not be given up.
void RedactedCopy::writeItems(std::ostream& output) const {
    Progress progress("copying " + recording_.name(), total_);
    const ReadBytes read = recording_.bytes();
    for (std::size_t i = 0; i < items_.size(); ++i) {
        const ContainerItem& item = items_[i];
        if (!item.holdsMetaData())
            copyBytes(read, recording_.name(), item.offset, item.size, output, progress);
        else if (isBeforeMedia(i))
            writeBlank(output, item);
        if (container() == MetaDataParser::Riff)
            output.seekp(static_cast<std::streamoff>(sizeOf(output, name_) % 2), std::ios::cur);
    }
}

void RedactedCopy::writeBlank(std::ostream& output, const ContainerItem& item) const {
    const auto end = static_cast<std::streamoff>(sizeOf(output, name_) + item.size);
    if (container() == MetaDataParser::Riff)
        writeBytes(output, detail::chunkHeader(detail::s_junkChunk, static_cast<std::uint32_t>(item.payloadSize())));
    else if (item.size > s_most32)
        writeBytes(output, detail::extendedAtomHeader(detail::s_freeAtom, item.size));
    else
        writeBytes(output, detail::atomHeader(detail::s_freeAtom, static_cast<std::uint32_t>(item.size)));
    output.seekp(end);
}

} // namespace Zulm
