#pragma once

// The entries of a stream of cursors, each with the picture that it shows.

#include "ZULMetaData/ZULMMetaDataCommon.h"
#include "ZULMetaDataSession/Retiming/EntryIndex.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace ZULMetaData::detail {

/// An entry shows its own picture. If it has none, it shows that of the last earlier entry of its identifier that has
/// one, and if there is no earlier one, that of the first later one.
class CursorEntries {
public:
    explicit CursorEntries(EntryIndex& index); ///< takes the entries of a stream of cursors, which must outlive it

    /// Returns whether two entries have the same identifier and show equal pictures.
    bool areSame(std::size_t left, std::size_t right) const {
        return entries_[left].id == entries_[right].id && entries_[left].picture == entries_[right].picture;
    }

    /// Returns the next entry of another stream, in which these entries stand one after the other as they are asked
    /// for. It carries its picture if the last one that was written for its identifier is another one. It has its old
    /// time. The bytes are valid until the next call.
    std::string_view written(std::size_t entry);

private:
    using Picture = std::optional<std::size_t>; ///< a place in `pictures_`

    struct Entry {
        std::uint64_t id = 0;
        Picture picture;
        bool isBare = false; ///< whether it is stored as an entry without a picture is
    };

    CursorImage decoded(std::size_t entry);
    Picture ownPictureOf(std::size_t entry, const CursorImage& cursor);
    std::string stored(const CursorImage& cursor, double time) const;

    EntryIndex& index_;
    std::vector<Entry> entries_;
    std::vector<std::size_t> pictures_; ///< pictures that differ, each as an entry that has it
    std::unordered_multimap<std::size_t, std::size_t> picturesByHash_;
    std::unordered_map<std::uint64_t, std::size_t> lastWritten_; ///< pictures by identifier
    std::string bytes_;
};

} // namespace ZULMetaData::detail
