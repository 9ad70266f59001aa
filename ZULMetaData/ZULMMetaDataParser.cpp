#include "ZULMetaData/ZULMMetaDataParser.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/ContainerScan.h"
#include "ZULMetaData/Containers/FileParser.h"
#include "ZULMetaData/PositionedInput.h"

#include <algorithm>
#include <iostream>
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
    auto parser = std::make_unique<detail::FileParser>(path, streamTypeOf(path));
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
    auto parser = std::make_unique<detail::StreamParser>(stream, type);
    return parser->cacheFileStreamInfo() ? std::move(parser) : nullptr;
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
    std::istream& stream = getStream();
    for (const auto& [type, range] : cache_) {
        if (!stream.good())
            stream.clear();
        const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
        stream.seekg(static_cast<std::streamoff>(range.offset));
        if (!stream.good())
            continue;
        std::string& bytes = out[type];
        bytes.clear();
        if (stream.peek() == std::istream::traits_type::eof())
            continue; // nothing there, or a directory, whose size means nothing
        const std::uint64_t held = std::min(range.length, total - std::min(range.offset, total));
        bytes.resize(static_cast<std::size_t>(std::min<std::uint64_t>(held, bytes.max_size())));
        stream.read(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        bytes.resize(static_cast<std::size_t>(stream.gcount()));
    }
}

void MetaDataParser::cacheStream(const uuid& type, CachedFileData place) {
    cache_[type] = place;
}

bool MetaDataParser::cacheFileStreamInfo() {
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
        detail::scanAtoms(stream, total, cache_);
    else
        detail::scanChunks(stream, total, cache_);
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
