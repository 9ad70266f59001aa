#pragma once

// Edit lists as texts, for the tests.

#include "ZULMetaDataSession/EditList.h"

#include <functional>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

/// Returns what the error says that `act` throws.
inline std::string errorOf(const std::function<void()>& act) {
    try {
        act();
    } catch (const Error& error) {
        return error.what();
    }
    return "no error";
}

/// Returns each piece as "start-end@speed=duration", or "at+duration" for a held frame.
inline std::vector<std::string> textsOf(const EditList& edits) {
    std::vector<std::string> texts;
    for (const EditPiece& piece : edits.pieces())
        texts.push_back(piece.isHeld() ? piece.start.text() + '+' + piece.duration.text()
                                       : piece.start.text() + '-' + piece.end.text() + '@' + piece.speed.text() + '=' +
                                             piece.duration.text());
    return texts;
}

/// Returns the pieces of a stored edit list, or what the error says.
inline std::vector<std::string> piecesOf(const std::string& bytes, const std::string& name,
                                         const EditListOptions& options = {}) {
    std::vector<std::string> texts;
    const std::string error =
        errorOf([&] { texts = textsOf(EditList::open(ByteSource::memory(bytes), name, options)); });
    return error == "no error" ? texts : std::vector{error};
}

inline EditListOptions atFrameRate(const Rational& frameRate) {
    EditListOptions options;
    options.frameRate = frameRate;
    return options;
}

inline EditListOptions ofDuration(const Rational& duration) {
    EditListOptions options;
    options.duration = duration;
    return options;
}

} // namespace ZULMetaData::Test
