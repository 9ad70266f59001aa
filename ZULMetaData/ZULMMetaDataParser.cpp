#include "ZULMetaData/ZULMMetaDataParser.h"

#include "ZULMetaData/ByteSourceStream.h"
#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/ContainerScan.h"
#include "ZULMetaData/FileInputBuffer.h"
#include "ZULMetaData/PositionedInput.h"

#include <algorithm>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <utility>

namespace ZULMetaData {

namespace {

/// From the last dot of the whole path on, in lower case.
std::string extensionOf(const std::string& path) {
    const std::size_t dot = path.rfind('.');
    std::string extension = dot == std::string::npos ? std::string() : path.substr(dot);
    const auto toLower = [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; };
    std::transform(extension.begin(), extension.end(), extension.begin(), toLower);
    return extension;
}

/// A file that is read through a buffer of its own.
struct InputFile {
    explicit InputFile(const std::string& path) : buffer(*stream.rdbuf()) {
        static_cast<std::istream&>(stream).rdbuf(&buffer); // only an `std::istream` takes another buffer
        fileOpen(stream, path.c_str(), std::ios_base::in | std::ios_base::binary);
    }

    std::ifstream stream;
    detail::FileInputBuffer buffer;
};

/// Reads a file or a source of its own, or a stream of the caller. Finds nothing before it scans.
class Parser final : public MetaDataParser {
public:
    Parser(const std::string& path, StreamType type)
        : file_(std::make_unique<InputFile>(path)), stream_(file_->stream), type_(type) {}
    Parser(ByteSource source, StreamType type)
        : source_(std::make_unique<ByteSourceStream>(std::move(source))), stream_(*source_), type_(type) {}
    Parser(std::istream& stream, StreamType type) : stream_(stream), type_(type) {}

    bool isOpen() const { return file_->stream.is_open(); }

    StreamType getStreamType() const override { return type_; }
    std::istream& getStream() override { return stream_; }
    void close() override {
        if (source_)
            source_->close();
        if (!file_)
            return;
        file_->stream.close();
        file_->buffer.forget();
    }

    /// Finds what the plain scan does, and what follows a RIFF chunk whose size is not in its header.
    void scanThoroughly(ScanMessages messages) {
        const ByteSource file = ByteSource::stream(stream_);
        rewind();
        scan(messages);
        requireReadable(stream_);
        if (type_ != Riff)
            return;
        ItemWalk chunks(file, Riff);
        const auto first = chunks.next();
        if (!first || first->sizeSource == ContainerItem::Header || chunks.position() >= file.size())
            return;
        rewind();
        detail::StreamCache found;
        detail::scanChunks(stream_, file.size(), found, messages, chunks.position());
        requireReadable(stream_);
        for (const auto& [type, place] : found)
            cacheStream(type, place);
    }

private:
    void rewind() {
        stream_.clear();
        stream_.seekg(0);
    }

    std::unique_ptr<InputFile> file_;          ///< is null if something else is read
    std::unique_ptr<ByteSourceStream> source_; ///< is null if something else is read
    std::istream& stream_;
    StreamType type_;
};

} // namespace

MetaDataParser::StreamType MetaDataParser::streamTypeOf(const std::string& path) {
    const std::string extension = extensionOf(path);
    if (extension == ".avi" || extension == ".wav")
        return Riff;
    if (extension == ".zcap" || extension == ".mp4" || extension == ".mov")
        return QuickTime;
    return extension == ".dat" ? RawStream : Unknown;
}

std::unique_ptr<MetaDataParser> MetaDataParser::create(const std::string& path) {
    auto parser = std::make_unique<Parser>(path, streamTypeOf(path));
    if (!parser->isOpen()) {
        std::cerr << "Can't parse metadata. Unable to open file: " << path << std::endl;
        return nullptr;
    }
    return parser->cacheFileStreamInfo() ? std::move(parser) : nullptr;
}

std::unique_ptr<MetaDataParser> MetaDataParser::create(std::istream& stream, StreamType type) {
    if (!stream.good()) {
        std::cerr << "Can't parse metadata. Stream is not good." << std::endl;
        return nullptr;
    }
    auto parser = std::make_unique<Parser>(stream, type);
    return parser->cacheFileStreamInfo() ? std::move(parser) : nullptr;
}

std::unique_ptr<MetaDataParser> openContainer(const std::string& path) {
    ByteSource file = ByteSource::file(path);
    const auto recognized = recognizeContainer(file, path);
    if (recognized.type == Container::Unknown)
        throw std::runtime_error(recognized.refusal());
    auto parser = std::make_unique<Parser>(std::move(file), recognized.type);
    parser->scanThoroughly(ScanMessages::Printed);
    return parser;
}

std::unique_ptr<MetaDataParser> openContainer(std::istream& stream, Container::Type type, ScanMessages messages) {
    auto parser = std::make_unique<Parser>(stream, type);
    parser->scanThoroughly(messages);
    return parser;
}

std::vector<uuid> MetaDataParser::getAvailableMetaDataUUIDs() const {
    std::vector<uuid> types;
    types.reserve(cache_.size());
    for (const auto& [type, range] : cache_)
        types.push_back(type);
    return types;
}

MetaDataParser::CachedFileData MetaDataParser::fileDataForUUID(const uuid& type) const {
    const auto found = cache_.find(type);
    return found == cache_.end() ? CachedFileData{0, 0} : found->second;
}

void MetaDataParser::loadAllData(std::map<uuid, std::string>& out) {
    for (const auto& [type, place] : cache_)
        if (std::string bytes; copyStream(place, bytes))
            out[type] = std::move(bytes);
}

std::string MetaDataParser::loadData(const uuid& type) {
    std::string bytes;
    if (const auto found = cache_.find(type); found != cache_.end())
        copyStream(found->second, bytes);
    return bytes;
}

/// Returns false if the stream cannot be found in the file.
bool MetaDataParser::copyStream(const CachedFileData& place, std::string& bytes) {
    std::istream& stream = getStream();
    if (!stream.good())
        stream.clear();
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
    stream.seekg(static_cast<std::streamoff>(place.offset));
    if (!stream.good())
        return false;
    if (stream.peek() == std::istream::traits_type::eof())
        return true; // nothing there, or a directory, whose size means nothing
    const std::uint64_t held = std::min(place.length, total - std::min(place.offset, total));
    bytes.resize(static_cast<std::size_t>(std::min<std::uint64_t>(held, bytes.max_size())));
    stream.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    bytes.resize(static_cast<std::size_t>(stream.gcount()));
    return true;
}

void MetaDataParser::cacheStream(const uuid& type, CachedFileData place) {
    cache_[type] = place;
}

bool MetaDataParser::cacheFileStreamInfo() {
    return scan(ScanMessages::Printed);
}

bool MetaDataParser::scan(ScanMessages messages) {
    const StreamType type = getStreamType();
    if (type == Unknown)
        return false;
    std::istream& stream = getStream();
    cache_.clear();
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
    stream.seekg(0);
    if (type == RawStream)
        detail::scanRawStream(stream, total, cache_);
    else if (type == QuickTime)
        detail::scanAtoms(stream, total, cache_, messages);
    else
        detail::scanChunks(stream, total, cache_, messages);
    return true;
}

namespace ParserUtil {

namespace {

detail::PositionedInput inputAt(std::istream& stream, std::uint64_t total) {
    return {stream, static_cast<std::uint64_t>(toInt64(stream.tellg())), total};
}

} // namespace

std::int64_t calcFileSize(std::istream& stream) {
    const std::streampos position = stream.tellg();
    stream.seekg(0, std::ios_base::end);
    const std::int64_t size = toInt64(stream.tellg());
    stream.seekg(position);
    return size;
}

bool enoughBytesLeft(std::istream& stream, std::uint64_t total, std::uint64_t needed) {
    return inputAt(stream, total).enoughBytesLeft(needed);
}

bool readAtomSizeAndType(std::istream& stream, std::uint64_t total, std::uint64_t& size, std::uint32_t& type) {
    detail::PositionedInput input = inputAt(stream, total);
    ContainerItem atom;
    if (!readAtomHeader(input, detail::ExtendedSizes::BelowHeader, atom) ||
        (atom.sizeField < detail::s_atomHeaderSize && !atom.isExtended()))
        return false;
    size = atom.size;
    type = atom.type.value;
    return true;
}

bool readChunkTypeAndSize(std::istream& stream, std::uint64_t total, std::uint32_t& type, std::uint32_t& size) {
    detail::PositionedInput input = inputAt(stream, total);
    ContainerItem chunk;
    chunk.type.value = swapInt(type);
    const bool isRead = readChunkHeader(input, chunk);
    type = swapInt(chunk.type.value); // is read even if the size is missing
    if (isRead)
        size = chunk.sizeField;
    return isRead;
}

} // namespace ParserUtil

} // namespace ZULMetaData
