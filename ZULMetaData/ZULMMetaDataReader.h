#pragma once

// Reads a metadata stream, from a file of its own or inside a container, and passes each entry to an observer.
//
//     struct Printer : DataStreamObserver<Point> {
//         bool dataRead(double time, const Point& value) override { std::cout << time << value; return true; }
//     } printer;
//     MetaDataReader<Point>::parseStream(printer, file, 0, fileSize, -1);

#include "../SharedDependencies/Export.h"
#include "CursorImageWriter.h"
#include "InvalidEntry.h"
#include "StreamBufferAccess.h"
#include "ZULMMetaDataCommon.h"
#include "ZULMMetaDataUUIDs.h"

#include <array>
#include <cstdint>
#include <cstring>
#include <istream>
#include <list>
#include <string>

namespace ZULMetaData {

/// Receives the entries of a stream. Readers never delete an observer.
template <class T>
class ZULMETADATA_API DataStreamObserver {
public:
    /// Called for every entry. `time` is in seconds; it is always 0 for a list of strings. Return false to end the
    /// parse.
    virtual bool dataRead(double time, const T& value) = 0;

protected:
    ~DataStreamObserver() = default;
};

/// Reads streams of one type of value. It has no state.
template <StreamValue T>
struct MetaDataReader {
    /// Reads the stream whose header is at `start`; `length` includes the header. An entry that begins before the end
    /// of the stream is read as a whole, even if it extends past the end. With `version` -1 every version up to the
    /// current one is accepted; otherwise `version` itself is accepted as well. A stream of any other version is
    /// refused with a line on standard output.
    ///
    /// Throws `InvalidEntry` if the input ends inside the time or the size of an entry. The entries before it have been
    /// delivered then. A value that is cut short is delivered with the bytes that exist, and a cursor image that there
    /// is no memory for without its image.
    static void parseStream(DataStreamObserver<T>& observer, std::istream& stream, std::uint64_t start,
                            std::uint64_t length, int version);

    /// Returns whether `parseStream` accepts a stream with this header. For an unknown kind it may print a line on
    /// standard output.
    static bool IsSupportedVersion(const MetaDataHeader& header, int version);
};

/// Reads one entry at the position of `stream`. `version` is the version in the stream's header. Texts are appended to
/// `value`. Throws as `parseStream` does.
///
/// The size of a text is trusted without a check. If the input ends inside the text, its last character is repeated, or
/// zeros are used if there is none. A size below 8 wraps around. The time of a list is not changed.
template <StreamValue T>
void metaDataRead(std::istream& stream, double* time, T* value, int version);

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

ZULMETADATA_API bool isSupportedVersion(const MetaDataHeader& header, int version);

/// Clears the state of the stream, seeks to `start` and reads the header there. Returns false if no entries can follow;
/// if the version was refused, this has been printed.
ZULMETADATA_API bool readSupportedHeader(std::istream& stream, std::uint64_t start, int version,
                                         MetaDataHeader& header);

/// Return the number of bytes that the entry took. The number means nothing if the input ended inside the entry.
ZULMETADATA_API std::uint64_t readStringEntry(std::istream& stream, double& time, std::string& text);
ZULMETADATA_API std::uint64_t readStringListEntry(std::istream& stream, std::list<std::string>& texts);

template <FixedSizeValue T>
std::uint64_t readFixedEntry(std::istream& stream, double& time, T& value) {
    std::array<char, sizeof time + sizeof value> entry;
    const std::size_t size = readBytes(stream, entry.data(), entry.size());
    if (size < sizeof time)
        throwIfInputEnded(stream);
    std::memcpy(&time, entry.data(), size < sizeof time ? size : sizeof time);
    if (size > sizeof time)
        std::memcpy(&value, entry.data() + sizeof time, size - sizeof time);
    return entry.size();
}

/// Delivers the entries that are in the get area as a whole, with at least one byte after them. The end of the input
/// need not be checked there, so an entry costs two loads and the call. Returns false if the observer ended the parse.
template <FixedSizeValue T>
bool readBufferedEntries(DataStreamObserver<T>& observer, std::istream& stream, std::uint64_t& position,
                         std::uint64_t end) {
    constexpr std::size_t size = sizeof(double) + sizeof(T);
    std::streambuf& buffer = *stream.rdbuf();
    while (position < end && StreamBufferAccess::available(buffer) > size && stream.good()) {
        const char* entry = StreamBufferAccess::getPosition(buffer);
        double time;
        T value;
        std::memcpy(&time, entry, sizeof time);
        std::memcpy(&value, entry + sizeof time, sizeof value);
        StreamBufferAccess::advanceGet(buffer, size);
        position += size;
        if (!observer.dataRead(time, value))
            return false;
    }
    return true;
}

/// Resets `value` for the next entry. A text keeps its memory.
template <StreamValue T>
void renew(T& value) {
    if constexpr (std::same_as<T, std::string>)
        value.clear();
    else
        value = T{};
}

template <StreamValue T>
std::uint64_t readEntry(std::istream& stream, double& time, T& value, [[maybe_unused]] int version) {
    if constexpr (FixedSizeValue<T>)
        return readFixedEntry(stream, time, value);
    else if constexpr (std::same_as<T, std::string>)
        return readStringEntry(stream, time, value);
    else if constexpr (std::same_as<T, std::list<std::string>>)
        return readStringListEntry(stream, value);
    else
        return readCursorImageEntry(stream, time, value, version);
}

} // namespace detail

template <StreamValue T>
void metaDataRead(std::istream& stream, double* time, T* value, int version) {
    detail::readEntry(stream, *time, *value, version);
}

template <StreamValue T>
bool MetaDataReader<T>::IsSupportedVersion(const MetaDataHeader& header, int version) {
    return detail::isSupportedVersion(header, version);
}

template <StreamValue T>
void MetaDataReader<T>::parseStream(DataStreamObserver<T>& observer, std::istream& stream, std::uint64_t start,
                                    std::uint64_t length, int version) {
    MetaDataHeader header;
    if (!detail::readSupportedHeader(stream, start, version, header))
        return;
    const std::uint64_t end = start + length;
    std::uint64_t position = start + s_metaDataHeaderSize; // counted here, because tellg() is a system call
    T value{};
    while (stream.good() && position < end) {
        if constexpr (FixedSizeValue<T>) {
            if (!detail::readBufferedEntries(observer, stream, position, end))
                return;
            if (!stream.good() || position >= end)
                return;
        }
        double time = 0;
        detail::renew(value);
        const std::uint64_t taken = detail::readEntry(stream, time, value, header.version);
        if (!observer.dataRead(time, value))
            return;
        if (taken == 0 || detail::isAtEnd(stream))
            return; // a version without fields would never reach the end
        position += taken;
    }
}

} // namespace ZULMetaData
