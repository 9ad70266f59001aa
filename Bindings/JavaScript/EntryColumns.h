#pragma once

// The entries of a stream as columns, one for every field of its kind.

#include "Bindings/JavaScript/zulmetadata_c.h"
#include "Bindings/Tables/Table.h"
#include "ZULMetaData/ZULMMetaDataCommon.h"

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace ZULMetaData::Bindings {

/// Takes one type of value all along. Texts and bytes are kept once: nearly all entries repeat what an earlier one
/// said.
class EntryColumn {
public:
    EntryColumn(const char* name, ZulmColumnType type) : name_(name), type_(type) {}

    /// Returns the column of a table.
    static EntryColumn of(const TableColumn& column);

    template <class Number>
    requires std::integral<Number> || std::same_as<Number, double>
    void add(Number value) {
        const auto bytes = std::as_bytes(std::span(&value, 1));
        values_.insert(values_.end(), bytes.begin(), bytes.end());
    }

    void add(float value);
    void add(const std::string& text);
    void add(const CursorImage& cursor); ///< its encoded image
    void add(const Text& text);          ///< nothing if it is not known
    void add(const Blob& bytes);         ///< nothing if there are none

    /// Valid until something is added.
    ZulmColumn view() const { return {name_, type_, values_.data(), pool_.data(), ends_.data(), ends_.size()}; }

private:
    void addDistinct(std::string_view value);

    const char* name_;
    ZulmColumnType type_;
    std::vector<std::byte> values_; ///< the numbers as they lie in memory
    std::string pool_;
    std::vector<std::uint64_t> ends_;
    std::unordered_map<std::string, std::uint32_t> places_; ///< among the distinct texts or bytes
    Blob lastBlob_;                                         ///< that was added
    std::uint32_t lastPlace_ = 0;                           ///< of it among them
};

} // namespace ZULMetaData::Bindings
