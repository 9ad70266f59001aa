#pragma once

// Streams and the containers around them, spelled out for the container tests.

#include "Tests/Support/Bytes.h"
#include "ZULMetaData/ZULMMetaDataParser.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <ostream>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

// The first group of digits of a kind's identifier tells it apart.
inline const std::string s_cursorLocations = "2b7b6af2";
inline const std::string s_scaleFactors = "2b7b6afb";
inline const std::string s_appNames = "2b7b6a06";

/// What is left of 64 bits that went below 0.
constexpr std::uint64_t minus(std::uint64_t value) {
    return 0 - value;
}

inline uuid kind(const std::string& group) {
    uuid type;
    const std::string bytes = hex(group + "7a1f 11e2 83d0 0017f200be7f");
    std::memcpy(type.data, bytes.data(), sizeof type.data);
    return type;
}

inline std::string pointEntry(double time, std::int32_t x, std::int32_t y) {
    return f64(time) + raw(x) + raw(y);
}

inline std::string textEntry(double time, const std::string& text) {
    return le32(static_cast<std::uint32_t>(8 + text.size())) + f64(time) + text;
}

/// 24 + 2 * 16 = 56 bytes.
inline std::string locationStream() {
    return streamHeader(s_cursorLocations, 1, 16) + pointEntry(0.5, 10, 20) + pointEntry(1.0, -3, 7);
}

/// 24 + 15 + 17 = 56 bytes.
inline std::string appNameStream() {
    return streamHeader(s_appNames, 1, 0) + textEntry(0.5, "Abc") + textEntry(2.0, "Notes");
}

/// 24 + 16 = 40 bytes.
inline std::string scaleStream(double scale) {
    return streamHeader(s_scaleFactors, 1, 16) + f64(0.0) + f64(scale);
}

/// 12 + 18 = 30 bytes.
inline std::string media() {
    return atom("ftyp", "mp42") + atom("mdat", "0123456789");
}

/// 8 + 12 = 20 bytes.
inline std::string riffMedia() {
    return chunk("RIFF", "AVI JUNKjunk");
}

inline std::string zulmAtom(const std::vector<std::string>& streams) {
    std::string children;
    for (const std::string& stream : streams)
        children += extendedAtom("DATA", stream);
    return extendedAtom("ZULM", children);
}

inline std::string zulmChunk(const std::vector<std::string>& streams) {
    std::string children;
    for (const std::string& stream : streams)
        children += chunk("DATA", stream);
    return chunk("ZULM", children);
}

struct FoundStream {
    uuid type;
    std::uint64_t offset;
    std::uint64_t length;

    friend bool operator==(const FoundStream&, const FoundStream&) = default;
    friend void PrintTo(const FoundStream& found, std::ostream* out) {
        *out << std::dec << found.offset << '+' << found.length << ' ' << found.type;
    }
};

/// In the order of their kinds.
inline std::vector<FoundStream> streamsOf(const MetaDataParser& parser) {
    std::vector<FoundStream> streams;
    for (const uuid& type : parser.getAvailableMetaDataUUIDs()) {
        const auto [offset, length] = parser.fileDataForUUID(type);
        streams.push_back({type, offset, length});
    }
    return streams;
}

/// Keeps what is delivered, and has enough of it after `limit` entries.
template <class T>
struct Entries final : DataStreamObserver<T> {
    bool dataRead(double time, const T& value) override {
        times.push_back(time);
        values.push_back(value);
        return values.size() < limit;
    }

    std::vector<double> times;
    std::vector<T> values;
    std::size_t limit = std::numeric_limits<std::size_t>::max();
};

/// Sizes that a walk could stumble over: none, below the header, at the edges of signed and unsigned numbers, and
/// such that the end of an atom near the start of its file wraps around.
inline const std::vector<std::uint64_t> s_hostileSizes = {
    0,
    1,
    2,
    7,
    8,
    9,
    15,
    16,
    17,
    23,
    24,
    0x7fffffff,
    0x80000000,
    0x80000001,
    0xfffffffe,
    0xffffffff,
    0x100000000,
    0x100000001,
    0x4000000000000000,
    0x7fffffffffffffff - 64,
    0x7fffffffffffffff - 30,
    0x7fffffffffffffff,
    0x8000000000000000,
    0x8000000000000001,
    minus(64),
    minus(46),
    minus(31),
    minus(30),
    minus(29),
    minus(16),
    minus(8),
    minus(1),
};

} // namespace ZULMetaData::Test
