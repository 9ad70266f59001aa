#include "ZULMetaDataSession/Retiming/CursorEntries.h"

#include "ZULMetaData/ZULMMetaDataWriter.h"

#include <functional>
#include <new>
#include <sstream>
#include <string_view>

namespace ZULMetaData::detail {

namespace {

std::string_view imageBytes(const CursorImage& cursor) {
    return {reinterpret_cast<const char*>(cursor.imageData), cursor.imageDataSize};
}

std::size_t pictureHash(const CursorImage& cursor) {
    std::string key(imageBytes(cursor));
    for (const std::int32_t number : {cursor.hotspotOffsetX, cursor.hotspotOffsetY, std::int32_t{cursor.cursorTypeId}})
        key.append(reinterpret_cast<const char*>(&number), sizeof number);
    return std::hash<std::string>()(key);
}

bool havePicturesAlike(const CursorImage& left, const CursorImage& right) {
    return left.hotspotOffsetX == right.hotspotOffsetX && left.hotspotOffsetY == right.hotspotOffsetY &&
           left.cursorTypeId == right.cursorTypeId && imageBytes(left) == imageBytes(right);
}

} // namespace

CursorEntries::CursorEntries(EntryIndex& index) : index_(index) {
    std::unordered_map<std::uint64_t, std::size_t> shown; // pictures by identifier
    std::unordered_map<std::uint64_t, std::size_t> first;
    const std::size_t bareSize = stored(CursorImage(), 0).size();
    for (std::size_t i = 0; i < index.size(); ++i) {
        const CursorImage cursor = decoded(i);
        const Picture own = ownPictureOf(i, cursor);
        if (own) {
            shown[cursor.uniqueId] = *own;
            first.emplace(cursor.uniqueId, *own);
        }
        const auto found = shown.find(cursor.uniqueId);
        entries_.push_back({cursor.uniqueId, found == shown.end() ? Picture() : found->second,
                            !own && index.bytesOf(i).size() == bareSize});
    }
    for (Entry& entry : entries_)
        if (const auto later = first.find(entry.id); !entry.picture && later != first.end())
            entry.picture = later->second;
}

std::string_view CursorEntries::written(std::size_t entry) {
    const auto& [id, picture, isBare] = entries_[entry];
    const auto last = lastWritten_.find(id);
    const bool isCarried = picture && (last == lastWritten_.end() || last->second != *picture);
    if (isBare && !isCarried)
        return index_.bytesOf(entry);
    CursorImage cursor = decoded(entry);
    if (isCarried) {
        const auto flags = cursor.flags;
        cursor = decoded(pictures_[*picture]);
        cursor.uniqueId = id;
        cursor.flags = flags;
        lastWritten_[id] = *picture;
    } else {
        cursor.freeImageData(true);
    }
    bytes_ = stored(cursor, index_.times()[entry]);
    return bytes_;
}

std::string CursorEntries::stored(const CursorImage& cursor, double time) const {
    std::ostringstream bytes;
    bytes.exceptions(std::ios_base::badbit);
    metaDataWrite(time, cursor, bytes, index_.header().version);
    return std::move(bytes).str();
}

CursorImage CursorEntries::decoded(std::size_t entry) {
    auto cursor = decodeEntry<CursorImage>(index_.bytesOf(entry), index_.header().version);
    if (!cursor)
        index_.refuseChange();
    return std::move(cursor->value);
}

CursorEntries::Picture CursorEntries::ownPictureOf(std::size_t entry, const CursorImage& cursor) {
    if (!cursor.imageData || cursor.imageDataSize == 0)
        return std::nullopt;
    const std::size_t hash = pictureHash(cursor);
    const auto [begin, end] = picturesByHash_.equal_range(hash);
    for (auto known = begin; known != end; ++known)
        if (havePicturesAlike(cursor, decoded(pictures_[known->second])))
            return known->second;
    picturesByHash_.emplace(hash, pictures_.size());
    pictures_.push_back(entry);
    return pictures_.size() - 1;
}

} // namespace ZULMetaData::detail
