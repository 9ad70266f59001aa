#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerLayout.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/RecordingInfo.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"
#include "ZULMetaDataBridge/Source/MovieTransaction.h"
#include "ZULMetaDataBridge/Source/ZULRAtomWriter.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <memory>
#include <optional>
#include <system_error>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_pieceSize = 1 << 18;

std::ifstream openMovie(const FileLocation& movie) {
    std::ifstream file;
    errno = 0;
    fileOpen(file, utf8Path(movie).c_str(), std::ios_base::binary);
    if (!file.is_open())
        throw SaveError(utf8Path(movie), std::string("cannot be opened: ") + std::strerror(errno));
    return file;
}

/// An empty file may yet become a movie; `repair` refuses it in words of its own.
void requireMovie(std::ifstream& file, const FileLocation& movie) {
    const RecognizedContainer recognized = recognizeContainer(file, utf8Path(movie));
    if (recognized.type == Container::QuickTime || sizeOfInput(file) == 0)
        return;
    throw SaveError(utf8Path(movie), recognized.type == Container::Unknown ? recognized.refusal()
                                     : recognized.type == Container::Riff
                                         ? "is a RIFF file by its contents, not a movie"
                                         : "is a stream file by its contents, not a movie");
}

std::unique_ptr<MetaDataParser> parserOver(std::ifstream& movie) {
    return MetaDataParser::create(movie, Container::QuickTime);
}

/// A stream that was found worth attaching.
struct Candidate {
    AttachedStream stream;
    StreamSource::Bytes source;
};

/// What makes a source doubtful; empty if nothing does.
std::string doubtAbout(const StreamExtent& extent, std::uint64_t length) {
    const MetaDataHeader& header = extent.header;
    const MetaDataKind* kind = findMetaDataKind(header.uuid);
    if (!kind)
        return "is no stream of a known kind: its header begins with the identifier " + metaDataKindName(header.uuid);
    const std::string name(kind->name);
    if (!isKnownStream(header))
        return "is a stream of the kind " + name + " in version " + std::to_string(header.version) +
               ", which is not known: the last known one is " + std::to_string(kind->currentVersion);
    if (extent.entries == 0 && length > s_metaDataHeaderSize)
        return "has " + std::to_string(length - s_metaDataHeaderSize) +
               " bytes after its header, but not one whole entry";
    return {};
}

Candidate examine(const StreamSource& source, SafeMovieSave::Sources sources) {
    Candidate candidate{{}, source.open()};
    const auto extent = measureStream(candidate.source.read, candidate.source.length);
    if (!extent)
        throw SaveError(source.name(), "too short for a stream: " + std::to_string(candidate.source.length) +
                                           " bytes of a " + std::to_string(s_metaDataHeaderSize) + "-byte header");
    if (sources == SafeMovieSave::Sources::Checked)
        if (const std::string doubt = doubtAbout(*extent, candidate.source.length); !doubt.empty())
            throw SaveError(source.name(), doubt, SaveError::Reason::Doubtful);
    candidate.stream = {source.name(),      extent->header.uuid, 0,
                        extent->wholeBytes, extent->entries,     candidate.source.length - extent->wholeBytes,
                        extent->end};
    return candidate;
}

std::vector<Candidate> examine(const FileLocation& movie, const std::vector<StreamSource>& sources,
                               SafeMovieSave::Sources which) {
    if (sources.empty())
        throw SaveError(utf8Path(movie), "there are no streams to attach");
    std::vector<Candidate> candidates;
    for (const StreamSource& source : sources) {
        try {
            candidates.push_back(examine(source, which));
        } catch (const std::system_error& error) {
            throw SaveError(source.name(), error.what());
        }
        const auto& added = candidates.back().stream;
        const auto first = std::find_if(candidates.begin(), candidates.end(),
                                        [&](const auto& candidate) { return candidate.stream.type == added.type; });
        if (&first->stream != &added)
            throw SaveError(added.name, "a second stream of the kind " + metaDataKindName(added.type) + ", beside " +
                                            first->stream.name);
    }
    return candidates;
}

void refuseExisting(const FileLocation& path, const std::vector<Candidate>& candidates) {
    std::ifstream movie = openMovie(path);
    const auto parser = parserOver(movie);
    for (const Candidate& candidate : candidates)
        if (const auto range = parser->fileDataForUUID(candidate.stream.type); range.offset != 0)
            throw SaveError(utf8Path(path),
                            "has a stream of the kind " + metaDataKindName(candidate.stream.type) +
                                " already, at offset " + std::to_string(range.offset),
                            SaveError::Reason::KindExists);
}

/// One save of one movie, from its repair to what is read back.
class Save {
public:
    Save(const FileLocation& movie, const SafeMovieSave::Progress& progress)
        : movie_(movie), progress_(progress), transaction_(movie) {}

    RepairPlan repair();
    AttachResult attach(std::vector<Candidate>& candidates, SafeMovieSave::Existing existing,
                        SafeMovieSave::FragmentIndex index);
    StampResult stamp(const ZCAPHeader& info, SafeMovieSave::FragmentIndex index);

    /// Runs `work`, and undoes what it did where it throws.
    template <class Work>
    auto orUndo(Work work) {
        try {
            return work(*this);
        } catch (const std::exception& failure) {
            undo(failure.what());
            throw;
        } catch (...) {
            undo("stopped");
            throw;
        }
    }

private:
    [[noreturn]] void fail(const std::string& sentence, SaveError::Reason reason = SaveError::Reason::Failed) const {
        throw SaveError(utf8Path(movie_), sentence, reason);
    }

    void write(Candidate& candidate);
    void verify(const std::vector<Candidate>& candidates);
    void compare(std::ifstream& movie, const Candidate& candidate);
    void read(const Candidate& candidate, std::uint64_t position, std::span<char> bytes) const;
    FragmentIndexState treat(SafeMovieSave::FragmentIndex index);
    void moveToEnd(const ContainerItem& index);
    void undo(const char* reason);
    void advance(std::uint64_t bytes);

    FileLocation movie_;
    SafeMovieSave::Progress progress_;
    MovieTransaction transaction_;
    std::uint64_t done_ = 0;
    std::uint64_t total_ = 0;
};

RepairPlan Save::repair() {
    std::ifstream movie = openMovie(movie_);
    requireMovie(movie, movie_);
    RepairPlan plan = planRepair(movie);
    if (transaction_.end() == 0)
        fail("is empty");
    if (plan.state == RepairPlan::Unrepairable)
        fail(plan.finding);
    transaction_.apply(plan.changes);
    return plan;
}

void Save::advance(std::uint64_t bytes) {
    done_ += bytes;
    if (progress_)
        progress_(done_, total_);
}

void Save::read(const Candidate& candidate, std::uint64_t position, std::span<char> bytes) const {
    if (candidate.source.read(position, bytes) != bytes.size())
        throw SaveError(candidate.stream.name, "cannot be read at offset " + std::to_string(position));
}

/// Calls `visit` with the position and size of every piece of a stream.
template <class Visit>
void inPieces(std::uint64_t length, Visit visit) {
    for (std::uint64_t position = 0; position < length; position += s_pieceSize)
        visit(position, static_cast<std::size_t>(std::min<std::uint64_t>(s_pieceSize, length - position)));
}

void Save::write(Candidate& candidate) {
    const std::uint64_t length = candidate.stream.bytes;
    transaction_.append(detail::extendedAtomHeader(detail::s_streamAtom, detail::s_extendedAtomHeaderSize + length));
    candidate.stream.offset = transaction_.end();
    std::vector<char> piece(s_pieceSize);
    inPieces(length, [&](std::uint64_t position, std::size_t size) {
        const std::span<char> bytes(piece.data(), size);
        read(candidate, position, bytes);
        transaction_.append(bytes);
        advance(size);
    });
}

void Save::compare(std::ifstream& movie, const Candidate& candidate) {
    const ReadBytes readMovie = readingFrom(movie);
    std::vector<char> expected(s_pieceSize);
    std::vector<char> found(s_pieceSize);
    inPieces(candidate.stream.bytes, [&](std::uint64_t position, std::size_t size) {
        read(candidate, position, {expected.data(), size});
        if (readMovie(candidate.stream.offset + position, {found.data(), size}) != size ||
            std::memcmp(expected.data(), found.data(), size) != 0)
            fail("does not hold what was written at offset " + std::to_string(candidate.stream.offset + position));
        advance(size);
    });
}

void Save::verify(const std::vector<Candidate>& candidates) {
    std::ifstream movie = openMovie(movie_);
    const auto parser = parserOver(movie);
    for (const Candidate& candidate : candidates) {
        const auto range = parser->fileDataForUUID(candidate.stream.type);
        requireReadable(movie);
        if (range.offset != candidate.stream.offset || range.length != candidate.stream.bytes)
            fail("does not show its stream of the kind " + metaDataKindName(candidate.stream.type) + " at offset " +
                 std::to_string(candidate.stream.offset) + " to a reader");
        compare(movie, candidate);
    }
}

/// Puts a copy at the end of the file, and then takes the old one's type away. If the program ends before it has, both
/// are good.
void Save::moveToEnd(const ContainerItem& index) {
    std::ifstream movie = openMovie(movie_);
    const ReadBytes readMovie = readingFrom(movie);
    const std::uint64_t start = transaction_.end();
    std::vector<char> piece(s_pieceSize);
    inPieces(index.size, [&](std::uint64_t position, std::size_t size) {
        const std::span<char> bytes(piece.data(), size);
        if (readMovie(index.offset + position, bytes) != size)
            fail("cannot be read at offset " + std::to_string(index.offset + position));
        if (position == 0) // open-ended until it is whole
            std::copy_n(detail::atomHeader(detail::s_freeAtom, 0).begin(), detail::s_atomHeaderSize, bytes.begin());
        transaction_.append(bytes);
    });
    transaction_.sync();
    transaction_.writeAppended(start, detail::atomHeader(detail::s_fragmentIndexAtom, index.sizeField));
    const std::uint64_t type = index.offset + sizeof index.sizeField;
    const auto name = [](std::uint32_t code) {
        const auto bytes = detail::bigEndianBytes(code);
        return std::string(bytes.begin(), bytes.end());
    };
    transaction_.apply({{type, name(detail::s_fragmentIndexAtom), name(detail::s_freeAtom),
                         "The old index of the fragments becomes a 'free' atom."}});
}

FragmentIndexState Save::treat(SafeMovieSave::FragmentIndex index) {
    std::optional<ContainerItem> found;
    {
        std::ifstream movie = openMovie(movie_);
        visitTopLevel(movie, Container::QuickTime, [&](const ContainerItem& item) {
            if (item.type == "mfra")
                found = item;
            return true;
        });
        requireReadable(movie);
    }
    if (!found)
        return FragmentIndexState::Absent;
    if (index == SafeMovieSave::FragmentIndex::Leave)
        return FragmentIndexState::NotAtEnd;
    moveToEnd(*found);
    return FragmentIndexState::AtEnd;
}

AttachResult Save::attach(std::vector<Candidate>& candidates, SafeMovieSave::Existing existing,
                          SafeMovieSave::FragmentIndex index) {
    AttachResult result{repair(), {}, FragmentIndexState::Absent};
    if (existing == SafeMovieSave::Existing::Refuse)
        refuseExisting(movie_, candidates);
    for (const Candidate& candidate : candidates)
        total_ += 2 * candidate.stream.bytes; // written, and read back
    transaction_.beginAtom(detail::s_metaDataAtom);
    for (Candidate& candidate : candidates)
        write(candidate);
    transaction_.endAtom();
    result.fragmentIndex = treat(index);
    verify(candidates);
    for (Candidate& candidate : candidates)
        result.streams.push_back(std::move(candidate.stream));
    return result;
}

StampResult Save::stamp(const ZCAPHeader& info, SafeMovieSave::FragmentIndex index) {
    StampResult result{repair(), {}, FragmentIndexState::Absent};
    transaction_.beginAtom(detail::s_recordingInfoAtom);
    transaction_.append({reinterpret_cast<const char*>(&info), sizeof info});
    transaction_.endAtom();
    result.fragmentIndex = treat(index);
    std::ifstream movie = openMovie(movie_);
    const auto infos = readRecordingInfo(*parserOver(movie));
    requireReadable(movie);
    if (infos.empty() || std::memcmp(&infos.back(), &info, sizeof info) != 0)
        fail("does not show its recording info to a reader");
    result.info = infos.back();
    return result;
}

void Save::undo(const char* reason) {
    try {
        transaction_.undo();
    } catch (const std::system_error& error) {
        fail(std::string(reason) + "; and it could not be made what it was: " + error.what(),
             SaveError::Reason::NotUndone);
    }
}

/// Names the movie where the platform does not.
template <class Work>
auto save(const FileLocation& movie, const SafeMovieSave::Progress& progress, Work work) {
    try {
        return Save(movie, progress).orUndo(work);
    } catch (const std::system_error& error) {
        throw SaveError(utf8Path(movie), error.what());
    }
}

} // namespace

SafeMovieSave::SafeMovieSave(FileLocation movie, Progress progress)
    : movie_(std::move(movie)), progress_(std::move(progress)) {}

RepairPlan SafeMovieSave::plan() const {
    std::ifstream movie = openMovie(movie_);
    try {
        requireMovie(movie, movie_);
        return planRepair(movie);
    } catch (const std::system_error& error) {
        throw SaveError(utf8Path(movie_), error.what());
    }
}

RepairPlan SafeMovieSave::repair() const {
    return save(movie_, progress_, [](Save& work) { return work.repair(); });
}

AttachResult SafeMovieSave::attach(const std::vector<StreamSource>& streams, Existing existing, Sources sources,
                                   FragmentIndex index) const {
    std::vector<Candidate> candidates = examine(movie_, streams, sources);
    return save(movie_, progress_, [&](Save& work) { return work.attach(candidates, existing, index); });
}

void SafeMovieSave::checkAttach(const std::vector<StreamSource>& streams, Existing existing, Sources sources) const {
    const std::vector<Candidate> candidates = examine(movie_, streams, sources);
    if (existing == Existing::Refuse)
        refuseExisting(movie_, candidates);
}

StampResult SafeMovieSave::stamp(const std::string& creatorName, const std::string& creatorVersion,
                                 FragmentIndex index) const {
    return save(movie_, progress_, [info = recordingInfo(creatorName, creatorVersion), index](Save& work) {
        return work.stamp(info, index);
    });
}

} // namespace ZULMetaData
