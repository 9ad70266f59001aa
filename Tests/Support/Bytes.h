#pragma once

// Bytes spelled out by hand, so that no test leans on the code that it tests.

#include <cstdint>
#include <cstring>
#include <string>

namespace ZULMetaData::Test {

/// "2b 7b 6a f2" and so on; white space counts for nothing.
inline std::string hex(const std::string& digits) {
    std::string bytes;
    std::string pair;
    for (const char c : digits) {
        if (c != ' ' && c != '\n')
            pair += c;
        if (pair.size() == 2) {
            bytes += static_cast<char>(std::stoi(pair, nullptr, 16));
            pair.clear();
        }
    }
    return bytes;
}

template <class T>
std::string raw(T value) {
    std::string bytes(sizeof value, '\0');
    std::memcpy(bytes.data(), &value, sizeof value);
    return bytes;
}

/// As streams and RIFF chunks store numbers.
inline std::string le32(std::uint32_t value) {
    return raw(value);
}
inline std::string le64(std::uint64_t value) {
    return raw(value);
}
inline std::string f32(float value) {
    return raw(value);
}
inline std::string f64(double value) {
    return raw(value);
}

/// As movie atoms store numbers.
inline std::string be32(std::uint32_t value) {
    std::string bytes;
    for (int shift = 24; shift >= 0; shift -= 8)
        bytes += static_cast<char>(value >> shift & 0xff);
    return bytes;
}

inline std::string be64(std::uint64_t value) {
    return be32(static_cast<std::uint32_t>(value >> 32)) + be32(static_cast<std::uint32_t>(value & 0xffffffff));
}

/// An atom whose size is in its first 4 bytes.
inline std::string atom(const std::string& type, const std::string& payload = {}) {
    return be32(static_cast<std::uint32_t>(8 + payload.size())) + type + payload;
}

/// An atom whose size follows its type.
inline std::string extendedAtom(const std::string& type, const std::string& payload = {}) {
    return be32(1) + type + be64(16 + payload.size()) + payload;
}

/// With its pad byte.
inline std::string chunk(const std::string& type, const std::string& data = {}) {
    return type + le32(static_cast<std::uint32_t>(data.size())) + data + std::string(data.size() % 2, '\0');
}

/// The 24 bytes in front of a stream; `group` is the first group of its kind's identifier.
inline std::string streamHeader(const std::string& group, std::int32_t version, std::uint32_t fixedEntrySize) {
    return hex(group) + hex("7a1f 11e2 83d0 0017f200be7f") + raw(version) + le32(fixedEntrySize);
}

} // namespace ZULMetaData::Test
