#pragma once

// What comes of reading a stream, written down so that a test can spell it out.

#include "Tests/Support/Bytes.h"
#include "Tests/ZULMetaData/Containers/ContainerBytes.h"
#include "ZULMetaData/ZULMMetaDataReader.h"

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <istream>
#include <list>
#include <sstream>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

inline std::string hexDigits(const std::string& bytes) {
    std::string digits;
    for (const char byte : bytes) {
        char pair[3];
        std::snprintf(pair, sizeof pair, "%02x", static_cast<unsigned>(static_cast<unsigned char>(byte)));
        digits += pair;
    }
    return digits;
}

/// "0a000000fcffffff": the bytes, so that zeros of either sign and all that is not a number differ.
template <FixedSizeValue T>
std::string asText(const T& value) {
    return hexDigits(raw(value));
}

inline std::string asText(const std::string& text) {
    return '"' + text + '"';
}

inline std::string asText(const std::list<std::string>& texts) {
    std::string text;
    for (const std::string& element : texts)
        text += (text.empty() ? "" : ", ") + asText(element);
    return '[' + text + ']';
}

/// "id 7, hotspot 3 -2, type 5, flags 1, 4 bytes 504e4721", or at the end "no image" or "4 bytes missing".
inline std::string asText(const CursorImage& image) {
    const std::string bytes(image.imageData, image.imageData ? image.imageData + image.imageDataSize : nullptr);
    const bool isNone = !image.imageData && image.imageDataSize == 0;
    return "id " + std::to_string(image.uniqueId) + ", hotspot " + std::to_string(image.hotspotOffsetX) + ' ' +
           std::to_string(image.hotspotOffsetY) + ", type " + std::to_string(image.cursorTypeId) + ", flags " +
           std::to_string(image.flags) + ", " +
           (isNone
                ? "no image"
                : std::to_string(image.imageDataSize) + " bytes " + (image.imageData ? hexDigits(bytes) : "missing"));
}

/// The bytes of the time, then the value.
template <class T>
std::string asText(double time, const T& value) {
    return hexDigits(f64(time)) + ' ' + asText(value);
}

/// What was delivered, and what ended the parse if it was an exception.
struct Reading {
    std::vector<std::string> entries;
    std::string error;

    friend bool operator==(const Reading&, const Reading&) = default;
    friend void PrintTo(const Reading& reading, std::ostream* out) {
        for (const std::string& entry : reading.entries)
            *out << entry << '\n';
        *out << (reading.error.empty() ? "" : "throws ") << reading.error;
    }
};

/// Describes entries as they come, before a copy could lose what an image says of bytes that are missing.
template <class T>
struct Describer final : DataStreamObserver<T> {
    bool dataRead(double time, const T& value) override {
        entries.push_back(asText(time, value));
        return true;
    }

    std::vector<std::string> entries;
};

template <class T>
Reading readStream(std::istream& stream, std::uint64_t start, std::uint64_t length, int version = -1) {
    Describer<T> observer;
    std::string error;
    try {
        MetaDataReader<T>::parseStream(observer, stream, start, length, version);
    } catch (const std::exception& exception) {
        error = exception.what();
    }
    return {observer.entries, error};
}

/// A stream that is all there is, down to wherever it may be cut.
template <class T>
Reading readStream(const std::string& bytes, int version = -1) {
    std::istringstream stream(bytes);
    return readStream<T>(stream, 0, bytes.size(), version);
}

} // namespace ZULMetaData::Test
