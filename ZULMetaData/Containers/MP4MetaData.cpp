#include "ZULMetaData/Containers/MP4MetaData.h"

#include "ZULMetaData/Containers/AtomFormat.h"
#include "ZULMetaData/Containers/AtomWriting.h"
#include "ZULMetaData/PositionedInput.h"
#include "ZULMetaData/StreamBufferAccess.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <algorithm>
#include <fstream>
#include <iostream>
#include <memory>
#include <sstream>
#include <stdexcept>

namespace ZULMetaData {

namespace {

constexpr std::size_t s_copySize = 2048;
constexpr std::size_t s_streamBufferSize = std::size_t{64} * 1024;

/// Returns the end of the last whole entry of a stream whose entries begin with their size. If not even the first entry
/// is whole, all of its bytes count, unless its size itself is torn.
std::uint64_t endOfSizedEntries(detail::PositionedInput& input) {
    std::uint64_t end = s_metaDataHeaderSize;
    while (input.position() < input.total()) {
        std::uint32_t size = 0;
        if (!input.read(&size, sizeof size))
            return end;
        if (size == 0)
            throw std::runtime_error("Got an entry size of 0");
        if (input.total() - input.position() < size)
            return end == s_metaDataHeaderSize ? input.total() : end;
        end = input.position() + size;
        input.moveTo(end);
    }
    return end;
}

/// Returns how much of a stream of `total` bytes, which stands at its start, is copied: the bytes up to the end of its
/// last whole entry. Nothing if it has no header.
std::uint64_t endOfWholeEntries(std::istream& stream, std::uint64_t total) {
    detail::PositionedInput input(stream, 0, total);
    MetaDataHeader header;
    if (!input.read(&header, sizeof header))
        return 0;
    if (header.fixedEntrySize == 0)
        return endOfSizedEntries(input);
    const std::uint64_t entries = (total - sizeof header) / header.fixedEntrySize;
    return sizeof header + entries * header.fixedEntrySize;
}

/// Straight from the one's get area into the other's put area.
void copyBytes(std::istream& from, std::ostream& to, std::uint64_t count) {
    std::streambuf& buffer = *from.rdbuf();
    while (count > 0 && from.peek() != std::istream::traits_type::eof()) {
        const std::size_t available = detail::StreamBufferAccess::available(buffer);
        const auto size = static_cast<std::size_t>(std::min<std::uint64_t>(count, std::min(available, s_copySize)));
        detail::writeBytes(to, detail::StreamBufferAccess::getPosition(buffer), size);
        detail::StreamBufferAccess::advanceGet(buffer, size);
        count -= size;
    }
}

/// The size in the atom is the stream's whole size, torn tail included.
void writeStream(std::ostream& movie, std::istream& stream) {
    const auto total = static_cast<std::uint64_t>(ParserUtil::calcFileSize(stream));
    const std::uint64_t end = endOfWholeEntries(stream, total);
    if (end == 0)
        return;
    const auto header = detail::extendedAtomHeader(detail::s_streamAtom, total + detail::s_extendedAtomHeaderSize);
    movie.write(header.data(), header.size());
    stream.clear();
    stream.seekg(0);
    copyBytes(stream, movie, end);
}

bool writeStreamFile(std::ostream& movie, const std::string& moviePath, const std::string& path) {
    const std::unique_ptr<char[]> buffer(new char[s_streamBufferSize]); // outlives the stream that reads into it
    std::ifstream file;
    file.rdbuf()->pubsetbuf(buffer.get(), s_streamBufferSize);
    fileOpen(file, path.c_str(), std::ios_base::in | std::ios_base::binary);
    if (!file.is_open() || !file.good()) {
        std::cout << "Couldn't open meta data file: " << moviePath << '\n'; // names the movie, not the file
        return false;
    }
    writeStream(movie, file);
    return true;
}

void finishAtom(std::ofstream& movie, const detail::OpenAtom& atom, const std::string& path) {
    const std::uint64_t size = detail::endAtom(movie, atom);
    std::fstream patch;
    fileOpen(patch, path.c_str(), std::ios_base::in | std::ios_base::out | std::ios_base::binary);
    detail::writeAtomSize(patch, atom.sizeField, size);
}

/// A movie opened for appending, with a large buffer.
class AppendedMovie {
public:
    explicit AppendedMovie(const std::string& path) {
        stream_.rdbuf()->pubsetbuf(buffer_.get(), s_bufferSize);
        fileOpen(stream_, path.c_str(), std::ios_base::app | std::ios_base::binary | std::ios_base::out);
    }
    std::ofstream& stream() { return stream_; }

private:
    static constexpr std::size_t s_bufferSize = std::size_t{128} * 1024;

    std::unique_ptr<char[]> buffer_{new char[s_bufferSize]}; // outlives the stream that writes out of it
    std::ofstream stream_;
};

} // namespace

bool MP4MetaData::appendMetaDataFiles(const std::string& path, const std::vector<std::string>& files) {
    AppendedMovie appended(path);
    std::ofstream& movie = appended.stream();
    if (!movie.is_open() || !movie.good()) {
        std::cout << "Couldn't open output file for appending meta data: " << path << std::endl;
        return false;
    }
    const detail::OpenAtom atom = detail::beginAtom(movie, detail::s_metaDataAtom);
    bool allWritten = true;
    for (const std::string& file : files)
        allWritten &= writeStreamFile(movie, path, file);
    finishAtom(movie, atom, path);
    return allWritten;
}

void MP4MetaData::appendMetaData(const std::string& path, const std::map<uuid, std::string>& streams) {
    AppendedMovie appended(path);
    std::ofstream& movie = appended.stream();
    const detail::OpenAtom atom = detail::beginAtom(movie, detail::s_metaDataAtom);
    for (const auto& [type, bytes] : streams) {
        std::stringstream stream(bytes);
        writeStream(movie, stream);
    }
    finishAtom(movie, atom, path);
}

} // namespace ZULMetaData
