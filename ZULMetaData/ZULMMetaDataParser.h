#pragma once

// Finds the metadata streams of a movie, a RIFF file or a bare stream file, and puts streams into a movie.
//
//     if (const auto parser = MetaDataParser::create("Recording.mp4"))
//         parser->loadDataType<Point>(s_cursorLocationUUID, observer, -1);

#include "../SharedDependencies/Export.h"
#include "Containers/ContainerType.h"
#include "Containers/MP4MetaData.h"
#include "Containers/Util.h"
#include "ZULMMetaDataReader.h"

#include <cstdint>
#include <istream>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace ZULMetaData {

/// Finds the streams of a file once, when it is created, and then reads from the places that it found. A parser has a
/// single read position, so calls must not overlap.
class ZULMETADATA_API MetaDataParser : public Container {
public:
    using StreamType = Container::Type; ///< the types have their names here too, such as `MetaDataParser::Riff`

    /// The place of a stream. Both numbers are 0 for a kind that the file does not have. The length is the one that the
    /// container declares; it may be larger than the file.
    struct CachedFileData {
        std::uint64_t offset; ///< the position of the header in the file
        std::uint64_t length; ///< the number of bytes, header included
    };

    /// Opens a file and keeps it open. The extension decides the type: .avi and .wav, .mp4, .mov and .zcap, or .dat, in
    /// upper or lower case. Returns null for any other extension, and if the file cannot be opened; in that case it
    /// prints a line on standard error.
    static std::unique_ptr<MetaDataParser> create(const std::string& path);

    /// Returns the type that the extension of `path` decides. Does not open the file.
    static StreamType streamTypeOf(const std::string& path);

    /// Reads from a stream of the caller, which must outlive the parser and is never closed. Returns null if `type` is
    /// `Unknown`, and if the state of the stream is not good; in that case it prints a line on standard error.
    static std::unique_ptr<MetaDataParser> create(std::istream& stream, StreamType type);

    virtual ~MetaDataParser() = default;
    virtual StreamType getStreamType() const = 0; ///< returns the type that was used to find the streams
    virtual std::istream& getStream() = 0;        ///< returns the stream that is read; its owner does not change

    /// Closes a file that the parser opened. The places stay known, but the streams cannot be read any more. Does
    /// nothing if the stream belongs to the caller.
    virtual void close() = 0;

    MetaDataParser(const MetaDataParser&) = delete;
    MetaDataParser& operator=(const MetaDataParser&) = delete;

    /// Returns the kinds that were found, in ascending order.
    std::vector<uuid> getAvailableMetaDataUUIDs() const;

    CachedFileData fileDataForUUID(const uuid& type) const; ///< returns the last stream of the kind

    /// Delivers the entries of a stream as `MetaDataReader<T>::parseStream` does. Does nothing if there is no such
    /// stream.
    template <StreamValue T>
    void loadDataType(const uuid& type, DataStreamObserver<T>& observer, int version);

    /// Copies the bytes of every stream that can be read, up to the end of the file.
    void loadAllData(std::map<uuid, std::string>& out);

    /// Returns the bytes that `loadAllData` copies for one kind, and reads no other stream. Empty if there is no such
    /// stream or it cannot be read.
    std::string loadData(const uuid& type);

    /// Forgets what was found and searches again. Returns false only for the type `Unknown`. If the stream is in an
    /// error or end-of-file state, clear it first; otherwise nothing is found.
    bool cacheFileStreamInfo();

protected:
    MetaDataParser() = default;

    /// Does what `cacheFileStreamInfo` does, and omits its messages if it is told to.
    bool scan(ScanMessages messages);

    /// Makes a stream known that the scan does not find. The next scan forgets it.
    void cacheStream(const uuid& type, CachedFileData place);

private:
    bool copyStream(const CachedFileData& place, std::string& bytes);

    std::map<uuid, CachedFileData> cache_;
};

/// Helpers for a stream of `total` bytes. The functions that read move the position of the stream, and return false if
/// too few bytes are left.
namespace ParserUtil {

/// Returns the size of the file, or -1 if the stream has failed. Does not change the position.
ZULMETADATA_API std::int64_t calcFileSize(std::istream& stream);

/// Returns whether at least `needed` bytes follow the position of the stream. Does not change the position.
ZULMETADATA_API bool enoughBytesLeft(std::istream& stream, std::uint64_t total, std::uint64_t needed);

/// Reads the header of an atom. The size includes the header. After a 32-bit size below 8, and not only after 1, a size
/// of 64 bits is read.
ZULMETADATA_API bool readAtomSizeAndType(std::istream& stream, std::uint64_t total, std::uint64_t& size,
                                         std::uint32_t& type);

/// Reads the header of a chunk. The size does not include the header. The type is returned as it is stored.
ZULMETADATA_API bool readChunkTypeAndSize(std::istream& stream, std::uint64_t total, std::uint32_t& type,
                                          std::uint32_t& size);

} // namespace ParserUtil

// ---------------------------------------------------------------------------------------------------------------

template <StreamValue T>
void MetaDataParser::loadDataType(const uuid& type, DataStreamObserver<T>& observer, int version) {
    const auto found = cache_.find(type);
    if (found != cache_.end())
        MetaDataReader<T>::parseStream(observer, getStream(), found->second.offset, found->second.length, version);
}

} // namespace ZULMetaData
