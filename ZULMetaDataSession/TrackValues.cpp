#include "ZULMetaDataSession/TrackValues.h"

#include "ZULMetaDataBridge/Source/EntryTexts.h"

#include <cstddef>
#include <iterator>
#include <unordered_map>

namespace ZULMetaData {

namespace {

using SharedPicture = std::shared_ptr<const CursorPicture>;

std::string textOrEmpty(const std::list<std::string>& texts, std::size_t position) {
    return position < texts.size() ? utf8FromLatin1(*std::next(texts.begin(), static_cast<std::ptrdiff_t>(position)))
                                   : std::string();
}

} // namespace

CursorAppearance trackValue(const CursorImage& stored) {
    CursorAppearance appearance;
    appearance.id = stored.uniqueId;
    appearance.flags = stored.flags;
    appearance.hasOwnPicture = stored.imageData && stored.imageDataSize != 0;
    if (appearance.hasOwnPicture)
        appearance.picture = std::make_shared<const CursorPicture>(
            CursorPicture{{stored.imageData, stored.imageData + stored.imageDataSize},
                          {stored.hotspotOffsetX, stored.hotspotOffsetY},
                          stored.cursorTypeId});
    return appearance;
}

SystemData trackValue(const std::list<std::string>& stored) {
    return {textOrEmpty(stored, 0), textOrEmpty(stored, 1), textOrEmpty(stored, 2), textOrEmpty(stored, 3)};
}

namespace detail {

void sharePictures(std::span<CursorAppearance> appearances) {
    std::unordered_map<std::uint64_t, SharedPicture> first;
    std::unordered_map<std::uint64_t, SharedPicture> latest;
    for (CursorAppearance& appearance : appearances) {
        SharedPicture& known = latest[appearance.id];
        if (!appearance.hasOwnPicture) {
            appearance.picture = known;
            continue;
        }
        if (known && *known == *appearance.picture)
            appearance.picture = known; // recorders may store the same picture again
        known = appearance.picture;
        first.try_emplace(appearance.id, known);
    }
    for (CursorAppearance& appearance : appearances)
        if (!appearance.picture)
            if (const auto found = first.find(appearance.id); found != first.end())
                appearance.picture = found->second;
}

} // namespace detail

} // namespace ZULMetaData
