#pragma once

// Finds texts that must not be in a copy: inside other texts, and anywhere in its bytes.
//
// A short text is found in the bytes of any movie by chance. So a text of fewer than eight characters, or of fewer than
// four different ones, is compared with whole texts and words only.

#include "SharedDependencies/Callback.h"
#include "ZULMetaData/ByteSource.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace ZULMetaData::detail {

class TextSearch {
public:
    /// Returns other ways to write a text, such as the normal forms of Unicode. May be empty.
    using Spellings = Callback<std::vector<std::string>(const std::string&)>;

    TextSearch(const std::set<std::string>& texts, const Spellings& spellings);

    bool isEmpty() const { return texts_.empty(); }

    /// Returns whether the text is one of those that are searched, or contains a long one.
    bool isIn(const std::string& text) const;

    /// Returns whether a text that is shown to people tells one of those that are searched: it is one, contains one as
    /// whole words, or is a long part of one.
    bool isToldBy(const std::string& shown) const;

    /// Returns where the first long text begins between `begin` and `end`, in UTF-8, Latin-1 or UTF-16 of either byte
    /// order. Calls `advance` with the number of bytes that were searched.
    std::optional<std::uint64_t> findIn(const ByteSource& file, std::uint64_t begin, std::uint64_t end,
                                        const std::function<void(std::uint64_t)>& advance) const;

private:
    void addNeedle(const std::string& bytes);
    std::optional<std::size_t> findIn(std::string_view bytes) const;

    std::set<std::string> texts_;                                               ///< in all their spellings
    std::vector<std::string> needles_;                                          ///< encodings of the long ones
    std::unordered_map<std::uint64_t, std::vector<std::size_t>> needlesByWord_; ///< by their first 8 bytes
    std::vector<bool> words_;                                                   ///< a filter before that map
};

/// Returns UTF-8 for bytes in UTF-16; a byte-order mark at the beginning counts, else they are big-endian.
std::string textFromUTF16(std::string_view bytes);

} // namespace ZULMetaData::detail
