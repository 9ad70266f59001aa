#pragma once

// Puts streams and recording info into a movie so that they are found again, or leaves it as it was.
//
//     const AttachResult saved = SafeMovieSave("Recording.mp4").attach({StreamSource::file("cursorLocation.dat")});
//     for (const AttachedStream& stream : saved.streams)
//         std::cout << stream.name << ": " << stream.entries << " entries, " << stream.bytesCut << " bytes cut off\n";

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../SharedDependencies/ZCAPHeader.h"
#include "../../ZULMetaData/ByteSource.h"
#include "../../ZULMetaData/Containers/RepairPlan.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "StreamSource.h"

#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Why a movie was not changed as it should: one sentence about one file.
class ZULMETADATA_API SaveError : public std::runtime_error {
public:
    /// What became of the movie.
    enum class Reason {
        Failed,     ///< the movie is what it was
        KindExists, ///< so it is, and has a stream of that kind already
        NotUndone,  ///< the operation failed, and the movie could not be made what it was
        Doubtful,   ///< the movie is what it was: a source does not look like a stream, see `StreamSource::unchecked`
    };

    /// `what()` returns both: the file, a colon and the sentence.
    SaveError(const std::string& file, const std::string& sentence, Reason reason = Reason::Failed)
        : std::runtime_error(file + ": " + sentence), file_(file), sentence_(sentence), reason_(reason) {}

    /// The movie's path, or the name of a stream's source.
    const std::string& file() const { return file_; }
    const std::string& sentence() const { return sentence_; } ///< without the file
    Reason reason() const { return reason_; }                 ///< tells what became of the movie

private:
    std::string file_;
    std::string sentence_;
    Reason reason_;
};

/// What became of one stream.
struct AttachedStream {
    std::string name;                                     ///< of its source
    uuid type{};                                          ///< its kind
    std::uint64_t offset = 0;                             ///< of its header in the movie
    std::uint64_t bytes = 0;                              ///< header and whole entries, or all of the source
    std::uint64_t entries = 0;                            ///< all that are whole
    std::uint64_t bytesCut = 0;                           ///< left out, from `bytes` on in the source
    StreamExtent::End cutBecause = StreamExtent::AtEntry; ///< `AtEntry` if nothing was cut
};

/// What became of the index of a movie's fragments. Players look for that atom (`mfra`) at the end of the file alone.
enum class FragmentIndexState {
    Absent,   ///< the movie has none
    NotAtEnd, ///< it is not at the end of the file, because of this append or an earlier one
    AtEnd,    ///< it was moved to the end
};

/// What was done to the movie.
struct AttachResult {
    RepairPlan repair;                                             ///< what was done before
    std::vector<AttachedStream> streams;                           ///< in the order in which they were given
    FragmentIndexState fragmentIndex = FragmentIndexState::Absent; ///< see `SafeMovieSave::FragmentIndex`
};

/// What was done to the movie.
struct StampResult {
    RepairPlan repair;                                             ///< what was done before
    ZCAPHeader info;                                               ///< as it can be read back
    FragmentIndexState fragmentIndex = FragmentIndexState::Absent; ///< see `SafeMovieSave::FragmentIndex`
};

/// What to do about streams of kinds that the movie has already. Readers take the last one; the others would stay in
/// the file, unread.
enum class ExistingStreams { Refuse, Supersede };

/// Streams that were examined and are worth attaching, to one movie or to a copy of it.
class ZULMETADATA_API AttachPlan {
public:
    /// Measures every stream. Throws `SaveError` if a stream cannot be read, if one has no header, if two are of one
    /// kind, and if a source that is checked does not look like a stream.
    explicit AttachPlan(const std::vector<StreamSource>& streams, ExistingStreams existing = ExistingStreams::Refuse);

    /// Throws `SaveError` if there is no stream, or if the movie has a stream of a kind that must not be there. Changes
    /// nothing; `SafeMovieSave::attach` does this once more when nobody else can change the movie. `name` is for
    /// messages.
    void requireFor(const ByteSource& movie, const std::string& name) const;

    /// Throws `SaveError` if there is no stream.
    void requireStreams(const std::string& name) const;

    /// One stream as it was measured.
    struct Stream {
        AttachedStream stream; ///< without a place in a movie
        ByteSource bytes;      ///< the source, header included
    };
    const std::vector<Stream>& streams() const { return streams_; } ///< returns them in the order of the sources

private:
    std::vector<Stream> streams_;
    ExistingStreams existing_;
};

/// Returns what a repair would do to a movie, and changes nothing. Throws `SaveError` if it is no movie or cannot be
/// read. `name` is for messages.
ZULMETADATA_API RepairPlan planSave(const ByteSource& movie, const std::string& name);

/// Every operation takes the file for what `recognizeContainer` says and throws `SaveError` if it is no movie. It then
/// repairs the movie as `planRepair` says, and throws `SaveError` if that cannot be done.
/// What it appends reaches the disk before its size does, and is read back. If anything fails, the repair included, the
/// movie becomes byte for byte what it was, and `SaveError` is thrown. If even that fails, the error says so.
///
/// A program that ends during an operation leaves an interrupted append, which the next operation repairs.
/// The movie is locked against other programs that use this class. Needs about a megabyte, whatever the streams hold.
class ZULMETADATA_API SafeMovieSave {
public:
    /// What to do about an index of fragments, which is no longer at the end of the file once something is appended.
    /// Players that use one then take longer to find a time. `MoveToEnd` copies it to the end and turns the old one
    /// into a `free` atom.
    enum class FragmentIndex { Leave, MoveToEnd };

    /// Called now and then with the bytes that were written or read back. What it throws ends and undoes the
    /// operation.
    using Progress = Callback<void(std::uint64_t done, std::uint64_t total)>;

    explicit SafeMovieSave(FileLocation movie, Progress progress = {}); ///< does not touch the movie

    /// Returns what `repair` would do. Changes nothing, and needs no right to.
    RepairPlan plan() const;

    /// Returns what was done.
    RepairPlan repair() const;

    /// Appends the streams as one atom, in this order. Bytes after the last whole entry of a stream are left out,
    /// unless its source is `asStored`. Throws what `AttachPlan` and its `requireFor` throw.
    ///@{
    AttachResult attach(const AttachPlan& plan, FragmentIndex index = FragmentIndex::Leave) const;
    AttachResult attach(const std::vector<StreamSource>& streams, ExistingStreams existing = ExistingStreams::Refuse,
                        FragmentIndex index = FragmentIndex::Leave) const {
        return attach(AttachPlan(streams, existing), index);
    }
    ///@}

    /// Appends what `ZULRAtomWriter::writeZULRtoFile` does, without ever ending the process. `creatorName` is not
    /// stored: on any system the platform's name, "Mac", stands in its place.
    StampResult stamp(const std::string& creatorName, const std::string& creatorVersion,
                      FragmentIndex index = FragmentIndex::Leave) const;

    /// Does what `attach` and then `stamp` do, but if either fails, neither was done.
    AttachResult attachAndStamp(const AttachPlan& plan, const std::string& creatorName,
                                const std::string& creatorVersion, FragmentIndex index = FragmentIndex::Leave) const;

private:
    FileLocation movie_;
    Progress progress_;
};

} // namespace ZULMetaData
