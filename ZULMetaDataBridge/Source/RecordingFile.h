#pragma once

// A movie, RIFF file or stream file that is opened to look into it: its streams, their entries, and what is wrong.
//
//     RecordingFile recording("Recording.mp4");
//     for (const StreamInfo& stream : recording.streams())
//         std::cout << stream.name() << ": " << recording.examine(stream).wholeEntries << " entries\n";

#include "../../Platform/FileLocation.h"
#include "../../SharedDependencies/Export.h"
#include "../../SharedDependencies/ZCAPHeader.h"
#include "../../ZULMetaData/ByteSource.h"
#include "../../ZULMetaData/StreamEntries.h"
#include "../../ZULMetaData/ZULMMetaDataParser.h"
#include "FileError.h"
#include "KindEntries.h"
#include "Validation/MetaDataValidator.h"

#include <concepts>
#include <cstdint>
#include <istream>
#include <list>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Where a stream of a recording is.
struct StreamInfo {
    uuid type{};                     ///< the identifier of its kind
    std::uint64_t offset = 0;        ///< the position of its header in the file
    std::uint64_t declaredBytes = 0; ///< the size that the container declares, header included
    std::uint64_t presentBytes = 0;  ///< how many of these bytes the file holds

    std::string name() const { return metaDataKindName(type); }      ///< its kind, or else its identifier
    bool isCutShort() const { return presentBytes < declaredBytes; } ///< returns true if the file ends too early

    /// Returns false if the atom around the stream is smaller than its own header. Readers then take the size of the
    /// stream for a huge number.
    bool hasRoom() const { return declaredBytes >= s_metaDataHeaderSize && declaredBytes >> 63 == 0; }
};

/// Finds the streams once, when it is created, and then reads from the places that it found. Calls must not overlap.
/// Functions that read throw `FileError` if that fails.
class ZULMETADATA_API RecordingFile {
public:
    /// Opens a file, and takes it for what `recognizeContainer` says. Errors call it `name`, or by its path if `name`
    /// is empty. Throws `FileError` if the file cannot be opened or read, and `std::runtime_error` with the refusal if
    /// it can hold no metadata.
    explicit RecordingFile(const FileLocation& file, std::string name = {});

    /// The same for bytes of the caller.
    RecordingFile(ByteSource bytes, std::string name, ScanMessages messages = ScanMessages::Printed);

    const std::string& path() const { return path_; } ///< the file's path; empty for bytes of the caller
    const std::string& name() const { return name_; } ///< what errors call it
    Container::Type container() const { return parser_->getStreamType(); } ///< what the file is
    MetaDataParser& parser() { return *parser_; }                          ///< for what needs a parser or its stream
    const ByteSource& bytes() const { return bytes_; }   ///< the file; errors of reading it are `FileError`
    std::uint64_t size() const { return bytes_.size(); } ///< the number of bytes in the file
    std::optional<double> duration() const;              ///< returns what `movieDuration` does, in seconds
    std::vector<ZCAPHeader> creators() const;            ///< returns what `readRecordingInfo` does

    /// Returns the result of a walk over every byte of the metadata. The walk is made at the first call.
    const ValidationReport& validation();

    /// Returns every stream that readers find, in the order of the identifiers.
    std::vector<StreamInfo> streams() const;

    /// Returns what `validation` says about such a stream. If it says nothing, `readableBytes` is 0.
    StreamReport examine(const StreamInfo& stream);
    std::vector<StreamReport> examinedStreams(); ///< returns the reports about all of them

    /// Returns the streams that the file holds and no reader finds, in the order of the file: a later stream of the
    /// same kind hides them, or they follow damage.
    std::vector<StreamReport> hiddenStreams();

    /// Returns the bytes of a stream, header included. The recording must outlive them.
    ByteSource bytesOf(const StreamInfo& stream) const { return bytes_.part(stream.offset, stream.presentBytes); }

    /// Returns the entries as the header divides them. The recording must outlive them.
    StreamEntries entriesOf(const StreamInfo& stream) const { return StreamEntries(bytesOf(stream)); }

    /// Calls `visit(time, value)` for each entry until it returns false, or until an entry does not fit its kind. As
    /// for an observer, the time of a list is 0. Returns the number of bytes up to there, header included; 0 for a
    /// stream that cannot be decoded. Throws `std::bad_alloc` if there is no memory for an image.
    template <StreamValue Value, class Visit>
    std::uint64_t readEntries(const StreamInfo& stream, Visit visit) const;

    /// The same for the entries that the report calls readable.
    template <StreamValue Value, class Visit>
    std::uint64_t readEntries(const StreamReport& stream, Visit visit) const {
        return readEntries<Value>(StreamInfo{stream.type, stream.offset, stream.declaredBytes, stream.readableBytes},
                                  visit);
    }

private:
    RecordingFile(std::string path, std::string name, std::optional<ByteSource> bytes, ScanMessages messages);

    std::string path_;
    std::string name_;
    ByteSource bytes_;
    std::unique_ptr<std::istream> input_; ///< what the parser reads
    std::unique_ptr<MetaDataParser> parser_;
    std::optional<ValidationReport> validation_;
};

// ---------------------------------------------------------------------------------------------------------------

template <StreamValue Value, class Visit>
std::uint64_t RecordingFile::readEntries(const StreamInfo& stream, Visit visit) const {
    StreamEntries entries = entriesOf(stream);
    if (!entries.header() || !isDecodable(*entries.header()))
        return 0;
    std::uint64_t end = entries.wholeBytes();
    while (const auto entry = entries.next()) {
        const auto decoded = decodeEntry<Value>(entries.bytesOf(*entry), entries.header()->version);
        if (!decoded)
            break;
        end = entry->end();
        if (!visit(std::same_as<Value, std::list<std::string>> ? 0 : decoded->time, decoded->value))
            break;
    }
    return end;
}

} // namespace ZULMetaData
