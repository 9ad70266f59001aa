#include "ZULMetaDataBridge/Source/Redaction/CopyCheck.h"

#include "ZULMetaData/ByteSourceStream.h"
#include "ZULMetaData/Containers/ContainerRecognition.h"
#include "ZULMetaData/Containers/RecordingInfo.h"
#include "ZULMetaDataBridge/Source/KindEntries.h"

#include <algorithm>
#include <cstring>
#include <fstream>

namespace ZULMetaData::detail {

namespace {

using Reason = RedactionError::Reason;

std::string placeText(const std::string& path, std::uint64_t offset) {
    return path + " at offset " + std::to_string(offset);
}

[[noreturn]] void failFor(const std::string& what, const std::string& path, std::uint64_t offset) {
    throw RedactionError(Reason::FoundInCopy, "the copy still holds " + what + ", in " + placeText(path, offset));
}

std::set<std::string> allOf(const RedactedTexts& texts) {
    std::set<std::string> all = texts.hidden;
    all.insert(texts.removed.begin(), texts.removed.end());
    return all;
}

/// An entry that stands for what was removed may be inside a removed range.
bool isPlaceholder(const RedactedEntry& entry) {
    if (entry.action != RedactedEntry::Removed || entrySizeOf(entry.header) != 0)
        return entry.action == RedactedEntry::Added;
    const auto decoded = decodeEntry<std::string>(entry.original, entry.header.version);
    return decoded && decoded->value == s_hiddenText;
}

} // namespace

std::vector<StreamPart> streamsIn(const ByteSource& file, Container::Type type) {
    ByteSourceStream input(file);
    const auto recording = openContainer(input, type);
    std::vector<StreamPart> streams;
    for (const uuid& kind : recording->getAvailableMetaDataUUIDs()) {
        const auto [offset, length] = recording->fileDataForUUID(kind);
        streams.push_back({kind, offset, length, file.part(offset, length)});
    }
    return streams;
}

MediaPlaces placesIn(const ByteSource& file, Container::Type type) {
    switch (type) {
    case Container::QuickTime: return findPlacesInMovie(file);
    case Container::Riff: return findPlacesInRIFF(file);
    default: return {};
    }
}

// Readers tell platforms apart by the name, and it is the same in every movie that is recorded.
ZCAPHeader neutralRecordingInfo() {
    ZCAPHeader info;
    info.headerVersion = 1;
    info.creator.setName(CreatorAttributes::platformNameMac());
    return info;
}

CopyCheck::CopyCheck(const RecordingRedaction& redaction, const Redaction& streams, const RedactedTexts& texts)
    : redaction_(redaction), streams_(streams), hidden_(texts.hidden, redaction.spellings),
      gone_(allOf(texts), redaction.spellings) {}

bool CopyCheck::tells(const MediaText& place) const {
    return std::any_of(place.texts.begin(), place.texts.end(), [&](const std::string& text) {
        if (place.role == MediaText::Role::Technical)
            return gone_.isIn(text);
        const bool isTitle = place.role == MediaText::Role::Title;
        return gone_.isToldBy(text) || (isTitle && redaction_.streams.hidesText && redaction_.streams.hidesText(text));
    });
}

void CopyCheck::requireNoTextStays(const MediaPlaces& media) const {
    if (!hasTexts() && !redaction_.removesChapters)
        return;
    if (!media.obstacles.empty()) {
        const MediaObstacle& first = media.obstacles.front();
        throw RedactionError(Reason::TextCannotGo, placeText(first.path, first.offset) + ' ' + first.reason);
    }
    std::vector<const MediaText*> telling;
    for (const MediaText& place : media.texts)
        if ((!redaction_.removesChapters || place.role == MediaText::Role::Caption) && tells(place))
            telling.push_back(&place);
    if (telling.empty())
        return;
    const bool hasCaption = std::any_of(telling.begin(), telling.end(),
                                        [](const auto* place) { return place->role == MediaText::Role::Caption; });
    std::string places = placeText(telling.front()->path, telling.front()->offset);
    for (std::size_t i = 1; i < telling.size(); ++i)
        places += (i + 1 < telling.size() ? ", " : " and ") + placeText(telling[i]->path, telling[i]->offset);
    throw RedactionError(hasCaption ? Reason::TextCannotGo : Reason::TextStays,
                         "texts that are to go are in the movie too: " + places);
}

void CopyCheck::requireClean(const ByteSource& copy, Container::Type type,
                             const std::function<void(std::uint64_t)>& advance) const {
    for (const StreamPart& stream : streamsIn(copy, type))
        requireCleanStream(stream);
    if (type == Container::RawStream)
        return;
    if (hasTexts())
        requireCleanTexts(placesIn(copy, type));
    requireCleanBytes(copy, type, advance);
    if (redaction_.removesCreator)
        requireNeutralInfo(copy, type);
}

/// A redaction that is applied once more must find nothing to do.
void CopyCheck::requireCleanStream(const StreamPart& stream) const {
    std::ofstream nowhere; // is not open and drops everything
    Redaction again = streams_;
    const std::string name = metaDataKindName(stream.type);
    again.onEntry = [&](const RedactedEntry& entry) {
        if (!isPlaceholder(entry))
            failFor("an entry that was to go", name, stream.offset);
    };
    if (redactStream(stream.bytes, again, nowhere).removal != RedactedStream::Kept)
        failFor("a stream that was to go", name, stream.offset);
}

void CopyCheck::requireCleanTexts(const MediaPlaces& media) const {
    for (const MediaText& place : media.texts)
        if (tells(place))
            failFor("a text that was to go", place.path, place.offset);
}

/// Streams that stay may contain the texts of kinds that are left out.
void CopyCheck::requireCleanBytes(const ByteSource& copy, Container::Type type,
                                  const std::function<void(std::uint64_t)>& advance) const {
    ItemWalk items(copy, type);
    while (const auto item = items.next()) {
        const TextSearch& search = item->holdsMetaData() ? hidden_ : gone_;
        if (const auto found = search.findIn(copy, item->offset, item->end(), advance))
            failFor("a text that was to go", item->type.text(), *found);
    }
}

void CopyCheck::requireNeutralInfo(const ByteSource& copy, Container::Type type) const {
    const ZCAPHeader neutral = neutralRecordingInfo();
    for (const ZCAPHeader& info : readRecordingInfo(copy, type))
        if (std::memcmp(&info, &neutral, sizeof info) != 0)
            throw RedactionError(Reason::FoundInCopy, "the copy still says who made the recording");
}

} // namespace ZULMetaData::detail
