#pragma once

// Writes a recording anew with less metadata: without the streams that later ones hide, or without any. The media is
// copied as it is and stays in its place.
//
//     RecordingFile recording("Recording.mp4");
//     RecordingCompaction compaction(recording, KeptMetaData::Newest);
//     // copy the first compaction.copiedBytes() bytes of the recording to "Smaller.mp4", then:
//     compaction.complete("Smaller.mp4");

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/Containers/ContainerLayout.h"
#include "RecordingFile.h"

#include <cstdint>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Which metadata a copy has.
enum class KeptMetaData {
    Newest,   ///< the streams that readers find, and who made the recording
    Creators, ///< who made the recording
    Nothing,
};

/// Why a recording cannot be written anew. `what()` is a sentence about the file that does not name it.
class ZULMETADATA_API CompactionError : public std::runtime_error {
public:
    /// What a program can offer to do about it.
    enum class Reason {
        NoContainer,       ///< the file is a stream alone
        Repairable,        ///< the movie has to be repaired first
        Damaged,           ///< the container is damaged
        UnreachableStream, ///< the copy would lose a stream that no reader finds
        TooLarge,          ///< the metadata does not fit into a RIFF file
        CannotWrite,       ///< the copy could not be written
    };

    /// `sentence` does not name the file.
    CompactionError(Reason reason, const std::string& sentence) : std::runtime_error(sentence), reason_(reason) {}

    Reason reason() const { return reason_; } ///< tells what can be done

private:
    Reason reason_;
};

/// Makes one copy. It decides what the copy holds when it is created.
class ZULMETADATA_API RecordingCompaction {
public:
    /// Throws `CompactionError`, and `FileError` if the recording cannot be read. `recording` must outlive this.
    RecordingCompaction(RecordingFile& recording, KeptMetaData kept);

    /// Returns how many bytes the copy shares with the recording before its metadata begins. The caller copies them, so
    /// that it can keep the holes of a sparse file and show its progress.
    std::uint64_t copiedBytes() const;

    /// Writes the rest of the copy and reads its streams back. Throws as the constructor does; the copy is unfinished
    /// then.
    void complete(const FileLocation& copy);

    const std::vector<StreamInfo>& streams() const { return streams_; } ///< returns those in the copy
    std::uint64_t streamsLeftOut() const { return streamsLeftOut_; }    ///< counts hidden streams too
    std::uint64_t creatorsLeftOut() const { return creatorsLeftOut_; }  ///< counts recording info that is in no copy
    std::uint64_t bytesCut() const { return bytesCut_; }                ///< counts bytes of incomplete entries
    std::uint64_t sizeAfter() const { return sizeAfter_; }              ///< returns the size of the copy in bytes

private:
    bool isMovie() const { return recording_.container() == Container::QuickTime; }
    void findTail();
    bool isCopyOfIndex(const ContainerItem& blank) const;
    void chooseCreators();
    ByteSource bytesOf(const ContainerItem& item) const { return recording_.bytes().part(item.offset, item.size); }
    void blankEarlierMetaData(std::ostream& out) const;
    void writeStreams(std::ostream& out);
    ByteSource wholePartOf(const StreamInfo& stream) const;
    void verify(const FileLocation& copy) const;

    RecordingFile& recording_;
    KeptMetaData kept_;
    std::vector<ContainerItem> items_;    ///< at the top level
    std::size_t tail_ = 0;                ///< the first item of the tail
    std::vector<ContainerItem> appended_; ///< recording info and the index of fragments, which follow the streams
    std::vector<StreamInfo> streams_;
    std::uint64_t streamsLeftOut_ = 0;
    std::uint64_t creatorsLeftOut_ = 0;
    std::uint64_t bytesCut_ = 0;
    std::uint64_t sizeAfter_ = 0;
};

} // namespace ZULMetaData
