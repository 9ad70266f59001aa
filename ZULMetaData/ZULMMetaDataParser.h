#pragma once

// Finds the metadata streams of a movie, a RIFF file or a bare stream file, and puts streams into a movie.
//
//     if (const auto parser = MetaDataParser::create("Recording.mp4"))
//         parser->loadDataType<Point>(s_cursorLocationUUID, observer, -1);

#include "../SharedDependencies/Export.h"
#include "ZULMMetaDataReader.h"

#include <cstdint>
#include <istream>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Scans its file once, when it is created, and then serves reads from the ranges that it found. Holds one stream
/// position: calls must not overlap.
class ZULMETADATA_API MetaDataParser {
public:
    /// RIFF chunks, the atoms of a movie, or a stream file without a container around it.
    enum StreamType : std::int32_t { Unknown, Riff, QuickTime, RawStream };

    /// Where a stream is: from its header on. Both 0 for a kind that is not there. The length is what the
    /// container declares, which may be more than the file holds.
    struct CachedFileData {
        std::uint64_t offset; ///< of its header, in the file
        std::uint64_t length; ///< in bytes, header included
    };

    /// Opens a file and keeps it open. The extension tells the container: .avi and .wav, .mp4, .mov and .zcap, or
    /// .dat, in any case. Null for any other, and for a file that cannot be opened (one line on standard error).
    static std::unique_ptr<MetaDataParser> create(const std::string& path);

    /// The container that the extension of `path` tells, without a look at the file.
    static StreamType streamTypeOf(const std::string& path);

    /// Reads from a stream of the caller, which must outlive the parser and is never closed. Null where its state
    /// is not good (one line on standard error) or the type is `Unknown`.
    static std::unique_ptr<MetaDataParser> create(std::istream& stream, StreamType type);

    virtual ~MetaDataParser() = default;
    virtual StreamType getStreamType() const = 0; ///< as the extension of its file tells, or as `create` was told
    virtual std::istream& getStream() = 0;        ///< stays the parser's, or the caller's; reading moves its position

    /// Of a file: what was found stays known, but cannot be read. Of a caller's stream: nothing.
    virtual void close() = 0;

    MetaDataParser(const MetaDataParser&) = delete;
    MetaDataParser& operator=(const MetaDataParser&) = delete;

    /// In ascending order.
    std::vector<uuid> getAvailableMetaDataUUIDs() const;

    CachedFileData fileDataForUUID(const uuid& type) const; ///< of several streams of a kind the last one

    /// Delivers a stream as `MetaDataReader<T>::parseStream` does; nothing where there is no such stream.
    template <StreamValue T>
    void loadDataType(const uuid& type, DataStreamObserver<T>& observer, int version);

    /// Copies the bytes of every stream, as far as the file holds them. Leaves out what cannot be reached.
    void loadAllData(std::map<uuid, std::string>& out);

    /// Scans anew, forgetting what was found before. False for `Unknown` alone. A stream that stands in an error
    /// or end-of-file state must be cleared first, or nothing is found.
    bool cacheFileStreamInfo();

protected:
    MetaDataParser() = default;

    /// Makes a stream known that the scan does not find. The next scan forgets it.
    void cacheStream(const uuid& type, CachedFileData place);

private:
    std::map<uuid, CachedFileData> cache_;
};

/// Helpers on a stream of `total` bytes. The readers move its position and fail, giving false, where the total
/// leaves too little.
namespace ParserUtil {

/// -1 for a stream that has failed. Keeps the position.
ZULMETADATA_API std::int64_t calcFileSize(std::istream& stream);

/// Whether `needed` bytes lie between the stream's position, which stays, and the total.
ZULMETADATA_API bool enoughBytesLeft(std::istream& stream, std::uint64_t total, std::uint64_t needed);

/// Any 32-bit size below 8, not only 1, is followed by a 64-bit one. The size counts the whole atom.
ZULMETADATA_API bool readAtomSizeAndType(std::istream& stream, std::uint64_t total, std::uint64_t& size,
                                         std::uint32_t& type);

/// The type as it is stored; the size counts the chunk's data.
ZULMETADATA_API bool readChunkTypeAndSize(std::istream& stream, std::uint64_t total, std::uint32_t& type,
                                          std::uint32_t& size);

} // namespace ParserUtil

/// Appends streams to a movie as one `ZULM` atom of `DATA` atoms. A trailing partial entry is left out, but the
/// size of its `DATA` atom counts it. Both throw `std::runtime_error` "Got an entry size of 0" for such an entry
/// in a stream of entries that vary in size; the atom then keeps a size of 0, which `finalizeAtomsInFile` mends.
struct ZULMETADATA_API MP4MetaData {
    /// False, with a line on standard output, where the movie or one of the streams cannot be opened. The other
    /// streams are appended all the same.
    static bool appendMetaDataFiles(const std::string& path, const std::vector<std::string>& files);

    /// The same from memory, in ascending order of the kinds. Failures are silent.
    static void appendMetaData(const std::string& path, const std::map<uuid, std::string>& streams);
};

/// What is done to a finished movie.
struct ZULMETADATA_API Util {
    /// Gives the last atom of a movie that was cut short its real size. True where the atoms (now) fill the file.
    /// An open-ended atom of 4 GiB and more needs the 8 spare bytes of a `wide` atom in front of it; it then gets
    /// the length that it had without them, 8 bytes less than it now has.
    static bool finalizeAtomsInFile(const std::string& path);

    /// The last value of the scale factor's stream read as a 64-bit float, or 1.0 where there is none.
    static double recordingScaleForMP4AtPath(const std::string& path);
};

// ---------------------------------------------------------------------------------------------------------------

template <StreamValue T>
void MetaDataParser::loadDataType(const uuid& type, DataStreamObserver<T>& observer, int version) {
    const auto found = cache_.find(type);
    if (found != cache_.end())
        MetaDataReader<T>::parseStream(observer, getStream(), found->second.offset, found->second.length, version);
}

} // namespace ZULMetaData
