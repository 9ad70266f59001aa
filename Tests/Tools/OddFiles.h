#pragma once

// Small files with something peculiar in them, spelled out by hand.

#include "Tests/Support/Bytes.h"
#include "Tests/Tools/RecordedSession.h"

#include <string>

namespace ZULMetaData::Test {

inline std::string pointEntry(double time, std::int32_t x, std::int32_t y) {
    return f64(time) + raw(x) + raw(y);
}

inline std::string textEntry(double time, const std::string& text) {
    return le32(static_cast<std::uint32_t>(8 + text.size())) + f64(time) + text;
}

/// Three positions at 0.5, 0.1 and 2 seconds; 0.1 has no exact 32-bit form.
inline std::string locations() {
    return streamHeader("2b7b6af2", 1, 16) + pointEntry(0.5, 10, -20) + pointEntry(0.1, 0, 7) + pointEntry(2, 3, 4);
}

/// A movie around a metadata atom with these children.
inline std::string movieWith(const std::string& children) {
    return tinyMovie() + extendedAtom("ZULM", children);
}

/// A known stream, one of no registered kind, one of a kind without entries to show, and an atom that is no stream.
inline std::string oddMovie() {
    return movieWith(extendedAtom("DATA", locations()) + atom("skip", "12345678") +
                     extendedAtom("DATA", streamHeader("2b7b6aff", 1, 12) + std::string(12, 'x')) +
                     extendedAtom("DATA", streamHeader("2b7b6aef", 1, 16) + pointEntry(1, 2, 3)));
}

inline std::string waveWithLocations() {
    return chunk("RIFF", "WAVE" + chunk("data", "odd")) + chunk("ZULM", chunk("DATA", locations()));
}

} // namespace ZULMetaData::Test
