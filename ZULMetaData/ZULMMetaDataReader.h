#pragma once

// Reads one metadata stream, alone in a file or inside a container, and hands each entry to an observer.
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

/// What gets the entries of a stream. Never deleted by its readers.
template <class T>
class ZULMETADATA_API DataStreamObserver {
public:
    /// `time` is in seconds; a list of strings always comes with 0. False ends the parse.
    virtual bool dataRead(double time, const T& value) = 0;

protected:
    ~DataStreamObserver() = default;
};

/// Reads streams of one type of value; holds nothing.
template <StreamValue T>
struct MetaDataReader {
    /// Reads the stream whose header stands at `start`; `length` counts the header. Entries are read while they
    /// begin in front of the end, whole even where they run past it. With `version` -1 every version up to the
    /// current one is read, else also exactly that version; any other is refused with one line on standard output.
    ///
    /// Throws `std::runtime_error` "invalid meta data entry" where the input ends before the time (or the size)
    /// of an entry does; what came before has been delivered. A value cut short is delivered with what is there.
    static void parseStream(DataStreamObserver<T>& observer, std::istream& stream, std::uint64_t start,
                            std::uint64_t length, int version);

    /// Whether `parseStream` accepts such a stream. An unknown kind may cause a line on standard output.
    static bool IsSupportedVersion(const MetaDataHeader& header, int version);
};

/// Reads one entry at the stream's position, of the version that the stream's header names. Texts are appended to
/// `value`. Throws as `parseStream` does.
///
/// The size of a text is believed: where the input ends early, its last character is repeated (zeros where there
/// was none), and a size below 8 wraps around. The time of a list is left alone.
template <StreamValue T>
void metaDataRead(std::istream& stream, double* time, T* value, int version);

// ---------------------------------------------------------------------------------------------------------------

namespace detail {

ZULMETADATA_API bool isSupportedVersion(const MetaDataHeader& header, int version);

/// Clears the stream's state, seeks to `start` and reads the header there. False where no entry can follow; a
/// refused version has then been reported.
ZULMETADATA_API bool readSupportedHeader(std::istream& stream, std::uint64_t start, int version,
                                         MetaDataHeader& header);

/// The readers give the bytes that the entry took; meaningless where the input ended inside it.
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

/// Delivers the entries that lie in the get area as a whole, with a byte behind them: there the end of the input is
/// out of sight, and an entry costs two loads and the call. False where the observer ended the parse.
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

/// A text keeps its memory from entry to entry.
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
    std::uint64_t position = start + s_metaDataHeaderSize; // counted: asking a file stream is a system call
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
            return; // a version without fields would never come to an end
        position += taken;
    }
}

} // namespace ZULMetaData
