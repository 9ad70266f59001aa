#pragma once

// Looks for what a copy must lack: before it is written, in the texts of the movie, and afterwards, in every byte.

#include "SharedDependencies/ZCAPHeader.h"
#include "ZULMetaData/ByteSource.h"
#include "ZULMetaData/Containers/ContainerType.h"
#include "ZULMetaDataBridge/Source/RecordingRedaction.h"
#include "ZULMetaDataBridge/Source/Redaction/MediaPlaces.h"
#include "ZULMetaDataBridge/Source/Redaction/TextSearch.h"

#include <functional>
#include <vector>

namespace ZULMetaData::detail {

/// A stream as far as a file holds it.
struct StreamPart {
    uuid type{};
    std::uint64_t offset = 0;   ///< of its header in the file
    std::uint64_t declared = 0; ///< bytes, header included
    ByteSource bytes;           ///< those that are there
};

/// Returns the streams that readers find, in the order of their identifiers.
std::vector<StreamPart> streamsIn(const ByteSource& file, Container::Type type);

/// Returns chapters, titles and captions of a container, and nothing for a stream file.
MediaPlaces placesIn(const ByteSource& file, Container::Type type);

/// The recording info that tells of no program and no system.
ZCAPHeader neutralRecordingInfo();

class CopyCheck {
public:
    /// `streams` is the redaction of every stream, the texts of all others included. All of them must outlive this.
    CopyCheck(const RecordingRedaction& redaction, const Redaction& streams, const RedactedTexts& texts);

    /// Throws `RedactionError` if the movie holds a text that is to go, in a place where it stays.
    void requireNoTextStays(const MediaPlaces& media) const;

    /// Throws `RedactionError` if the copy holds anything that was to go.
    void requireClean(const ByteSource& copy, Container::Type type,
                      const std::function<void(std::uint64_t)>& advance) const;

private:
    bool hasTexts() const { return !gone_.isEmpty() || redaction_.streams.hidesText; }
    bool tells(const MediaText& place) const;
    void requireCleanStream(const StreamPart& stream) const;
    void requireCleanTexts(const MediaPlaces& media) const;
    void requireCleanBytes(const ByteSource& copy, Container::Type type,
                           const std::function<void(std::uint64_t)>& advance) const;
    void requireNeutralInfo(const ByteSource& copy, Container::Type type) const;

    const RecordingRedaction& redaction_;
    const Redaction& streams_;
    TextSearch hidden_; ///< must not be in the streams either
    TextSearch gone_;   ///< these, and the texts of streams that are left out
};

} // namespace ZULMetaData::detail
