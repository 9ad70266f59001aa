#pragma once

// Writes a metadata stream file: a header, followed by entries of a time and a value.
//
//     MetaDataWriter<Point, int, int> writer;
//     writer.init("CursorLocation.dat", s_cursorLocationUUID, 1);
//     writer.write(0.25, Point(10, -4), true);
//     writer.close();

#include "../SharedDependencies/EndianFile.h"
#include "../SharedDependencies/Export.h"
#include "CursorImageWriter.h"
#include "StreamBufferAccess.h"
#include "ZULMMetaDataCommon.h"
#include "ZULMMetaDataUUIDs.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <list>
#include <memory>
#include <ostream>
#include <string>

namespace ZULMetaData {

/// Returns the size in bytes of an entry that holds a `T`, or 0 if the entries vary in size.
template <StreamValue T>
std::uint32_t metaDataFixedEntrySize();

/// Appends one entry to `stream`. `version` is the version of the stream; only cursor images have more than one. A
/// failure sets the state of `stream` and is not reported otherwise.
template <StreamValue T>
void metaDataWrite(double time, const T& value, std::ostream& stream, int version);

/// Writes a stream file of values of type `T`. No function reports an error: if the file cannot be opened or written,
/// the stream that `getStream` returns is in a failed state, and entries are dropped. `A` and `B` have no effect.
template <StreamValue T, class A, class B>
class ZULMETADATA_API MetaDataWriter {
public:
    MetaDataWriter() = default;
    MetaDataWriter(const MetaDataWriter&) = delete;
    MetaDataWriter& operator=(const MetaDataWriter&) = delete;

    /// Creates or empties the file at `path` and writes the header.
    void init(const std::string& path, const uuid& typeUuid, int version);

    /// Writes the header and flushes it. `init` has already done this.
    void writeHeader(const uuid& typeUuid, int version);

    /// Appends an entry at `time`, in seconds on the time line of the recording. Without `flush` the entry may stay in
    /// the buffer.
    void write(double time, const T& value, bool flush);

    /// Writes what is in the buffer and closes the file. May be called more than once.
    void close();

    virtual std::ofstream& getStream() { return stream; } ///< returns the stream of the file; its state shows failures

    /// Closes the file. If the caller has set the stream's exception mask, an exception from closing ends the process.
    ~MetaDataWriter() { close(); }

private:
    static constexpr std::size_t s_bufferSize = std::size_t{64} * 1024;

    std::string path;
    std::unique_ptr<char[]> buffer; // outlives the stream that writes out of it
    std::ofstream stream;
    std::int32_t version = 0;
};

// ---------------------------------------------------------------------------------------------------------------

template <StreamValue T>
std::uint32_t metaDataFixedEntrySize() {
    if constexpr (FixedSizeValue<T>)
        return sizeof(double) + sizeof(T);
    else
        return 0;
}

namespace detail {

/// Returns the size that is stored before an entry. It has 32 bits on disk; the size of a longer text wraps around.
inline std::uint32_t stringEntrySize(const std::string& text) {
    return static_cast<std::uint32_t>(text.size() + sizeof(double));
}

inline void writeStringEntry(double time, const std::string& text, std::ostream& stream) {
    std::array<char, sizeof(std::uint32_t) + sizeof(double)> prefix;
    const std::uint32_t size = stringEntrySize(text);
    std::memcpy(prefix.data(), &size, sizeof size);
    std::memcpy(prefix.data() + sizeof size, &time, sizeof time);
    writeBytes(stream, prefix.data(), prefix.size());
    writeBytes(stream, text.data(), text.size());
}

/// The list has no time field of its own: every element repeats the time.
inline void writeStringListEntry(double time, const std::list<std::string>& texts, std::ostream& stream) {
    std::array<std::uint32_t, 2> totalAndCount{sizeof(std::uint32_t), static_cast<std::uint32_t>(texts.size())};
    for (const std::string& text : texts)
        totalAndCount[0] += static_cast<std::uint32_t>(sizeof(std::uint32_t)) + stringEntrySize(text);
    stream.write(reinterpret_cast<const char*>(totalAndCount.data()), sizeof totalAndCount);
    for (const std::string& text : texts)
        writeStringEntry(time, text, stream);
}

template <FixedSizeValue T>
void packFixedEntry(double time, const T& value, char* entry) {
    std::memcpy(entry, &time, sizeof time);
    std::memcpy(entry + sizeof time, &value, sizeof value);
}

/// Separate from the fast path, which keeps nothing in memory whose address is known elsewhere.
template <FixedSizeValue T>
[[gnu::noinline]] void writeFixedEntryAcrossBlocks(double time, T value, std::ostream& stream) {
    std::array<char, sizeof(double) + sizeof(T)> entry;
    packFixedEntry(time, value, entry.data());
    writeAcrossBlocks(stream, entry.data(), entry.size());
}

template <FixedSizeValue T>
void writeFixedEntry(double time, const T& value, std::ostream& stream) {
    constexpr std::size_t size = sizeof(double) + sizeof(T);
    if (char* place = placeFor(stream, size)) {
        packFixedEntry(time, value, place);
        StreamBufferAccess::advancePut(*stream.rdbuf(), size);
    } else {
        writeFixedEntryAcrossBlocks(time, value, stream);
    }
}

} // namespace detail

template <StreamValue T>
void metaDataWrite(double time, const T& value, std::ostream& stream, [[maybe_unused]] int version) {
    if constexpr (FixedSizeValue<T>)
        detail::writeFixedEntry(time, value, stream);
    else if constexpr (std::same_as<T, std::string>)
        detail::writeStringEntry(time, value, stream);
    else if constexpr (std::same_as<T, std::list<std::string>>)
        detail::writeStringListEntry(time, value, stream);
    else
        detail::writeCursorImageEntry(time, value, stream, version);
}

template <StreamValue T, class A, class B>
void MetaDataWriter<T, A, B>::init(const std::string& filePath, const uuid& typeUuid, int streamVersion) {
    version = streamVersion;
    path = filePath;
    if (!buffer)
        buffer = std::make_unique<char[]>(s_bufferSize);
    if (!stream.is_open()) // an open file might lose what is in its buffer
        stream.rdbuf()->pubsetbuf(buffer.get(), s_bufferSize);
    fileOpen(stream, path.c_str(), std::ios_base::binary | std::ios_base::out | std::ios_base::trunc);
    writeHeader(typeUuid, version);
    detail::StreamBufferAccess::shortenPutArea(*stream.rdbuf(), s_metaDataHeaderSize); // blocks end on page boundaries
}

template <StreamValue T, class A, class B>
void MetaDataWriter<T, A, B>::writeHeader(const uuid& typeUuid, int streamVersion) {
    const MetaDataHeader header{typeUuid, streamVersion, metaDataFixedEntrySize<T>()};
    stream.write(reinterpret_cast<const char*>(&header), sizeof header);
    stream.flush();
}

template <StreamValue T, class A, class B>
void MetaDataWriter<T, A, B>::write(double time, const T& value, bool flush) {
    metaDataWrite<T>(time, value, stream, version);
    if (flush)
        stream.flush();
}

template <StreamValue T, class A, class B>
void MetaDataWriter<T, A, B>::close() {
    if (!stream.is_open())
        return;
    if (stream.bad()) // part of the buffer may be on the disk; closing would write that part a second time
        detail::StreamBufferAccess::discardPut(*stream.rdbuf());
    stream.close();
}

} // namespace ZULMetaData
