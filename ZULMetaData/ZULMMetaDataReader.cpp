#include "ZULMetaData/ZULMMetaDataReader.h"

#include <algorithm>
#include <iostream>

namespace ZULMetaData::detail {

bool isSupportedVersion(const MetaDataHeader& header, int version) {
    if (header.version > 0 && header.version <= MetaDataUUID::currentVersionForUUID(header.uuid))
        return true;
    return version != -1 && header.version == version;
}

bool readSupportedHeader(std::istream& stream, std::uint64_t start, int version, MetaDataHeader& header) {
    if (!stream.good())
        stream.clear();
    stream.seekg(static_cast<std::streamoff>(start));
    stream.read(reinterpret_cast<char*>(&header), sizeof header);
    if (!isSupportedVersion(header, version)) {
        std::cout << "MetaDataReader<T>::parseFile - Version is larger than what we can handle\n";
        return false;
    }
    return !stream.eof();
}

namespace {

/// Appends `count` characters: at once if the get area holds them, and otherwise in pieces, so that no more memory is
/// asked for than the input can fill until it turns out to be shorter.
void appendCharacters(std::istream& stream, std::uint32_t count, std::string& text) {
    if (stream.good() && StreamBufferAccess::available(*stream.rdbuf()) >= count) {
        text.append(StreamBufferAccess::getPosition(*stream.rdbuf()), count);
        StreamBufferAccess::advanceGet(*stream.rdbuf(), count);
        return;
    }
    std::array<char, 4096> piece;
    char last = '\0';
    while (count > 0) {
        const std::size_t wanted = std::min<std::size_t>(count, piece.size());
        const auto size = static_cast<std::uint32_t>(readBytes(stream, piece.data(), wanted));
        if (size == 0) {
            text.append(count, last);
            return;
        }
        text.append(piece.data(), size);
        last = piece[size - 1];
        count -= size;
    }
}

} // namespace

std::uint64_t readStringEntry(std::istream& stream, double& time, std::string& text) {
    std::uint32_t size = 0; // of the time and the characters
    readBytes(stream, reinterpret_cast<char*>(&size), sizeof size);
    throwIfInputEnded(stream);
    readBytes(stream, reinterpret_cast<char*>(&time), sizeof time);
    const std::uint32_t count = size - static_cast<std::uint32_t>(sizeof time);
    appendCharacters(stream, count, text);
    return sizeof size + sizeof time + std::uint64_t{count};
}

std::uint64_t readStringListEntry(std::istream& stream, std::list<std::string>& texts) {
    std::uint32_t total = 0; // counts what follows, and is not needed
    std::uint32_t count = 0;
    readBytes(stream, reinterpret_cast<char*>(&total), sizeof total);
    throwIfInputEnded(stream);
    readBytes(stream, reinterpret_cast<char*>(&count), sizeof count);
    std::uint64_t taken = sizeof total + sizeof count;
    for (; count > 0; --count) {
        double unusedTime = 0;
        taken += readStringEntry(stream, unusedTime, texts.emplace_back());
    }
    return taken;
}

} // namespace ZULMetaData::detail
