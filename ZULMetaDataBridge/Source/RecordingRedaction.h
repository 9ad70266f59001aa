#pragma once

// Copies a whole recording without what nobody else should see: its streams, the texts of its movie, and who made it.
//
//     RecordingRedaction redaction;
//     redaction.streams.clearsKeys = true;
//     redaction.removesChapters = true;
//     const ByteSource recording = ByteSource::file("Recording.mp4");
//     RecordingRedactor(recording, Container::QuickTime, redaction).write("Public.mp4");

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Callback.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ByteSource.h"
#include "../../ZULMetaData/Containers/ContainerType.h"
#include "StreamRedaction.h"

#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

namespace ZULMetaData {

/// What a copy of a recording must lack.
///
/// The samples of pictures and sound are never changed, and everything in the copy keeps its place: what is removed
/// from the movie becomes free space that is filled with zeros.
struct RecordingRedaction {
    Redaction streams; ///< of all its streams; a text that one stream makes a secret is hidden in every stream

    /// Chapters, titles, tags, comments and names of tracks in the movie or RIFF file become free space. Captions are
    /// not touched.
    bool removesChapters = false;

    /// The recording info says that the program and the system have no version, and has the name that every recorder
    /// stores.
    bool removesCreator = false;

    /// Free space, and atoms or chunks of unknown types at the top level, become free space that is filled with zeros.
    bool blanksUnknown = false;

    /// Returns other ways to write a text, such as the normal forms of Unicode, in which the text must not be found
    /// either. May be empty.
    Callback<std::vector<std::string>(const std::string&)> spellings;
};

/// A part of the container, apart from the streams, that the copy lacks.
struct RedactedPlace {
    /// Why the copy lacks it.
    enum Reason : std::int32_t {
        Text,    ///< `removesChapters`
        Creator, ///< `removesCreator`
        Unknown, ///< `blanksUnknown`
    };

    Reason reason = Text;     ///< what asked for it
    std::string path;         ///< the types that lead to it, such as "moov/udta"; UTF-8
    std::uint64_t offset = 0; ///< of its header, in the original and in the copy
    std::uint64_t size = 0;   ///< header included; the samples of a track of texts go too
};

/// What a copy lacks.
struct RedactedRecording {
    std::vector<RedactedStream> streams;  ///< those that readers find, in the order of their identifiers
    std::vector<RedactedPlace> places;    ///< in the order of the file
    std::uint64_t unreachableStreams = 0; ///< streams that readers do not find; the copy never has them
};

/// Why there is no copy.
class ZULMETADATA_API RedactionError : public std::runtime_error {
public:
    /// What a program can offer to do about it.
    enum class Reason {
        Repairable,      ///< the movie has to be repaired first
        Damaged,         ///< the container is damaged
        MisplacedStream, ///< a stream is outside of the metadata and would stay in the copy
        TextStays,       ///< a text that is to go is in the movie too, where `removesChapters` would remove it
        TextCannotGo,    ///< a text that is to go is in a place where it cannot be removed, or that cannot be read
        NothingLeft,     ///< the copy of a stream file would be empty
        TooLarge,        ///< the metadata does not fit into a RIFF file
        CannotWrite,     ///< the copy could not be written
        FoundInCopy,     ///< something that was to go is in the copy, which must not be used
    };

    /// `sentence` does not name the file.
    RedactionError(Reason reason, const std::string& sentence) : std::runtime_error(sentence), reason_(reason) {}

    Reason reason() const { return reason_; } ///< tells what can be done

private:
    Reason reason_;
};

/// Makes one copy. Needs memory for the texts that go, and a few megabytes.
class ZULMETADATA_API RecordingRedactor {
public:
    /// What is being done.
    enum class Step { Searching, Copying, Checking };

    /// Called now and then with the bytes of a step that are done. What it throws ends the work.
    using Progress = Callback<void(Step step, std::uint64_t done, std::uint64_t total)>;

    /// Throws `std::system_error` if the recording cannot be read.
    RecordingRedactor(ByteSource recording, Container::Type type, RecordingRedaction redaction, Progress progress = {});
    ~RecordingRedactor();
    RecordingRedactor(const RecordingRedactor&) = delete;
    RecordingRedactor& operator=(const RecordingRedactor&) = delete;

    /// Returns whether the recording has neither streams that readers find nor anything else that would go.
    bool isEmpty() const;

    /// Returns what `write` would do, without writing. Throws what `write` would throw, unless only writing tells.
    RedactedRecording preview();

    /// Fills the file `copy`, which gets the container of the original. Reads it back, and throws if anything that was
    /// to go is found in it: an entry, or a text in UTF-8, UTF-16 or Latin-1. A text of fewer than eight characters, or
    /// of fewer than four different ones, stands in any movie by chance; such a text is looked for in the streams and
    /// in the chapters, titles, tags and captions of the movie only.
    ///
    /// Throws `RedactionError`, and `std::system_error` if the recording cannot be read. The file is unfinished then.
    RedactedRecording write(const FileLocation& copy);

private:
    class Work;
    std::unique_ptr<Work> work_;
};

} // namespace ZULMetaData
