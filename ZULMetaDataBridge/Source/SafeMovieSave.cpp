#include "ZULMetaDataBridge/Source/SafeMovieSave.h"

#include "ZULMetaData/ByteSourceStream.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/RecordingInfo.h"
#include "ZULMetaData/ZULMMetaDataParser.h"
#include "ZULMetaDataBridge/Source/FileError.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"
#include "ZULMetaDataBridge/Source/MovieFile.h"
#include "ZULMetaDataBridge/Source/ZULRAtomWriter.h"

#include <algorithm>
#include <cstring>
#include <optional>
#include <span>
#include <system_error>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_pieceSize = 1 << 18;

/// An empty file may yet become a movie; `repair` refuses it in words of its own.
void requireMovie(const ByteSource& file, const std::string& name) {
    const RecognizedContainer recognized = recognizeContainer(file, name);
    if (recognized.type == Container::QuickTime || file.size() == 0)
        return;
    throw SaveError(name, recognized.type == Container::Unknown ? recognized.refusal()
                          : recognized.type == Container::Riff  ? "is a RIFF file by its contents, not a movie"
                                                                : "is a stream file by its contents, not a movie");
}

/// Returns the streams that readers find in a movie.
class FoundStreams {
public:
    explicit FoundStreams(const ByteSource& movie)
        : stream_(movie), parser_(MetaDataParser::create(stream_, Container::QuickTime)) {
        requireReadable(stream_);
    }

    MetaDataParser::CachedFileData placeOf(const uuid& type) const { return parser_->fileDataForUUID(type); }

private:
    ByteSourceStream stream_;
    std::unique_ptr<MetaDataParser> parser_;
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

AttachPlan::Stream measured(const StreamSource& source) {
    const ByteSource bytes = source.open();
    const auto extent = measureStream(bytes);
    if (!extent)
        throw SaveError(source.name(), "too short for a stream: " + std::to_string(bytes.size()) + " bytes of a " +
                                           std::to_string(s_metaDataHeaderSize) + "-byte header");
    if (source.isChecked())
        if (const std::string doubt = doubtAbout(*extent, bytes.size()); !doubt.empty())
            throw SaveError(source.name(), doubt, SaveError::Reason::Doubtful);
    if (source.isAsStored())
        return {{source.name(), extent->header.uuid, 0, bytes.size(), extent->entries, 0, StreamExtent::AtEntry},
                bytes};
    return {{source.name(), extent->header.uuid, 0, extent->wholeBytes, extent->entries,
             bytes.size() - extent->wholeBytes, extent->end},
            bytes};
}

/// One save of one movie, from its repair to what is read back.
class Save {
public:
    Save(const FileLocation& movie, const SafeMovieSave::Progress& progress)
        : name_(utf8Path(movie)), progress_(progress), file_(movie) {}

    RepairPlan repair() {
        const ByteSource movie = file_.bytes();
        RepairPlan plan = planSave(movie, name_);
        if (movie.size() == 0)
            fail("is empty");
        if (plan.state == RepairPlan::Unrepairable)
            fail(plan.finding);
        file_.apply(plan.changes);
        return plan;
    }

    AttachResult attach(const AttachPlan& plan, SafeMovieSave::FragmentIndex index) {
        AttachResult result{repair(), {}, FragmentIndexState::Absent};
        plan.requireFor(file_.bytes(), name_);
        for (const auto& [stream, bytes] : plan.streams())
            total_ += 2 * stream.bytes; // written, and read back
        countIndex(index);
        file_.beginAtom(detail::s_metaDataAtom);
        for (const AttachPlan::Stream& stream : plan.streams())
            result.streams.push_back(append(stream));
        file_.endAtom();
        result.fragmentIndex = treat(index);
        requireInPlace();
        const FoundStreams found(file_.bytes());
        for (std::size_t i = 0; i < result.streams.size(); ++i)
            verify(result.streams[i], plan.streams()[i].bytes, found);
        return result;
    }

    StampResult stamp(const ZCAPHeader& info, SafeMovieSave::FragmentIndex index) {
        StampResult result{repair(), {}, FragmentIndexState::Absent};
        countIndex(index);
        file_.beginAtom(detail::s_recordingInfoAtom);
        file_.append({reinterpret_cast<const char*>(&info), sizeof info});
        file_.endAtom();
        result.fragmentIndex = treat(index);
        requireInPlace();
        const auto infos = readRecordingInfo(file_.bytes(), Container::QuickTime);
        if (infos.empty() || std::memcmp(&infos.back(), &info, sizeof info) != 0)
            fail("does not show its recording info to a reader");
        result.info = infos.back();
        return result;
    }

    /// Runs `work`, and undoes what it did if it throws.
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
        throw SaveError(name_, sentence, reason);
    }

    void requireInPlace() const {
        if (!file_.isInPlace())
            fail("was removed or replaced by another program meanwhile");
    }

    AttachedStream append(const AttachPlan::Stream& stream) {
        AttachedStream written = stream.stream;
        file_.append(
            detail::extendedAtomHeader(detail::s_streamAtom, detail::s_extendedAtomHeaderSize + written.bytes));
        written.offset = file_.end();
        inPieces(stream.bytes, written.bytes, written.name,
                 [&](std::uint64_t, std::span<const char> piece) { file_.append(piece); });
        return written;
    }

    void verify(const AttachedStream& written, const ByteSource& bytes, const FoundStreams& found) {
        const auto place = found.placeOf(written.type);
        if (place.offset != written.offset || place.length != written.bytes)
            fail("does not show its stream of the kind " + metaDataKindName(written.type) + " at offset " +
                 std::to_string(written.offset) + " to a reader");
        const ByteSource movie = file_.bytes();
        std::vector<char> stored(s_pieceSize);
        inPieces(bytes, written.bytes, written.name, [&](std::uint64_t position, std::span<const char> piece) {
            const std::uint64_t offset = written.offset + position;
            if (movie.read(offset, std::span(stored).first(piece.size())) != piece.size() ||
                std::memcmp(piece.data(), stored.data(), piece.size()) != 0)
                fail("does not hold what was written at offset " + std::to_string(offset));
        });
    }

    std::optional<ContainerItem> findIndex() const {
        std::optional<ContainerItem> found;
        ItemWalk atoms(file_.bytes(), Container::QuickTime);
        while (const auto atom = atoms.next())
            if (atom->type == detail::s_fragmentIndexAtom)
                found = atom;
        return found;
    }

    void countIndex(SafeMovieSave::FragmentIndex index) {
        if (const auto moved = index == SafeMovieSave::FragmentIndex::MoveToEnd ? findIndex() : std::nullopt)
            total_ += moved->size;
    }

    FragmentIndexState treat(SafeMovieSave::FragmentIndex index) {
        const auto found = findIndex();
        if (!found)
            return FragmentIndexState::Absent;
        if (index == SafeMovieSave::FragmentIndex::Leave)
            return FragmentIndexState::NotAtEnd;
        moveToEnd(*found);
        return FragmentIndexState::AtEnd;
    }

    /// Puts a copy at the end of the file, and then takes the type of the old one away. If the program ends in between,
    /// both are good.
    void moveToEnd(const ContainerItem& index) {
        const std::uint64_t start = file_.end();
        const ByteSource old = file_.bytes().part(index.offset, index.size);
        inPieces(old, index.size, name_, [&](std::uint64_t position, std::span<char> piece) {
            if (position == 0) // open-ended until it is whole
                std::copy_n(detail::atomHeader(detail::s_freeAtom, 0).begin(), detail::s_atomHeaderSize, piece.begin());
            file_.append(piece);
        });
        file_.sync();
        file_.writeAppended(start, detail::atomHeader(detail::s_fragmentIndexAtom, index.sizeField));
        file_.apply({{index.offset + sizeof index.sizeField, detail::s_fragmentIndexAtom.text(),
                      detail::s_freeAtom.text(), "The old index of the fragments becomes a 'free' atom."}});
    }

    void undo(const char* reason) {
        try {
            file_.undo();
        } catch (const std::system_error& error) {
            fail(std::string(reason) + "; and it could not be made what it was: " + error.what(),
                 SaveError::Reason::NotUndone);
        }
    }

    /// Calls `visit` with every piece of a source and its position. Throws `SaveError` if the source ends early.
    template <class Visit>
    void inPieces(const ByteSource& source, std::uint64_t size, const std::string& name, Visit visit) {
        std::vector<char> piece(s_pieceSize);
        for (std::uint64_t position = 0; position < size; position += piece.size()) {
            piece.resize(static_cast<std::size_t>(std::min<std::uint64_t>(s_pieceSize, size - position)));
            if (source.read(position, piece) != piece.size())
                throw SaveError(name, "cannot be read at offset " + std::to_string(position));
            visit(position, std::span<char>(piece));
            done_ += piece.size();
            if (progress_)
                progress_(done_, total_);
        }
    }

    std::string name_;
    SafeMovieSave::Progress progress_;
    MovieFile file_;
    std::uint64_t done_ = 0;
    std::uint64_t total_ = 0;
};

/// Runs `work` and adds the name to errors of the platform.
template <class Work>
auto naming(const std::string& name, Work work) {
    try {
        return work();
    } catch (const FileError& error) {
        throw SaveError(error.file(), error.sentence());
    } catch (const std::system_error& error) {
        throw SaveError(name, error.what());
    }
}

template <class Work>
auto save(const FileLocation& movie, const SafeMovieSave::Progress& progress, Work work) {
    return naming(utf8Path(movie), [&] { return Save(movie, progress).orUndo(work); });
}

} // namespace

RepairPlan planSave(const ByteSource& movie, const std::string& name) {
    return naming(name, [&] {
        requireMovie(movie, name);
        return planRepair(movie);
    });
}

AttachPlan::AttachPlan(const std::vector<StreamSource>& streams, ExistingStreams existing) : existing_(existing) {
    for (const StreamSource& source : streams) {
        streams_.push_back(naming(source.name(), [&] { return measured(source); }));
        const AttachedStream& added = streams_.back().stream;
        const auto first = std::find_if(streams_.begin(), streams_.end(),
                                        [&](const Stream& other) { return other.stream.type == added.type; });
        if (&first->stream != &added)
            throw SaveError(added.name, "a second stream of the kind " + metaDataKindName(added.type) + ", beside " +
                                            first->stream.name);
    }
}

void AttachPlan::requireStreams(const std::string& name) const {
    if (streams_.empty())
        throw SaveError(name, "there are no streams to attach");
}

void AttachPlan::requireFor(const ByteSource& movie, const std::string& name) const {
    requireStreams(name);
    if (existing_ == ExistingStreams::Supersede)
        return;
    const auto found = naming(name, [&] { return std::make_unique<FoundStreams>(movie); });
    for (const auto& [stream, bytes] : streams_)
        if (const auto place = found->placeOf(stream.type); place.offset != 0)
            throw SaveError(name,
                            "has a stream of the kind " + metaDataKindName(stream.type) + " already, at offset " +
                                std::to_string(place.offset),
                            SaveError::Reason::KindExists);
}

SafeMovieSave::SafeMovieSave(FileLocation movie, Progress progress)
    : movie_(std::move(movie)), progress_(std::move(progress)) {}

RepairPlan SafeMovieSave::plan() const {
    const std::string name = utf8Path(movie_);
    return planSave(naming(name, [&] { return ByteSource::file(name); }), name);
}

RepairPlan SafeMovieSave::repair() const {
    return save(movie_, progress_, [](Save& work) { return work.repair(); });
}

AttachResult SafeMovieSave::attach(const AttachPlan& plan, FragmentIndex index) const {
    plan.requireStreams(utf8Path(movie_));
    return save(movie_, progress_, [&](Save& work) { return work.attach(plan, index); });
}

StampResult SafeMovieSave::stamp(const std::string& creatorName, const std::string& creatorVersion,
                                 FragmentIndex index) const {
    return save(movie_, progress_, [info = recordingInfo(creatorName, creatorVersion), index](Save& work) {
        return work.stamp(info, index);
    });
}

AttachResult SafeMovieSave::attachAndStamp(const AttachPlan& plan, const std::string& creatorName,
                                           const std::string& creatorVersion, FragmentIndex index) const {
    plan.requireStreams(utf8Path(movie_));
    return save(movie_, progress_, [&plan, info = recordingInfo(creatorName, creatorVersion), index](Save& work) {
        AttachResult result = work.attach(plan, FragmentIndex::Leave);
        result.fragmentIndex = work.stamp(info, index).fragmentIndex;
        return result;
    });
}

} // namespace ZULMetaData
