#pragma once

// The entries of a stream as columns, one for every field of its kind.

#include "Bindings/JavaScript/zulmetadata_c.h"
#include "ZULMetaData/ZULMMetaDataCommon.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace ZULMetaData::Bindings {

/// Texts or bytes, each kept once. Nearly all entries repeat what an earlier one said.
class DistinctValues {
public:
    void add(std::string_view value);
    void addNothing() { indices_.push_back(ZulmNothing); }

    const std::vector<std::uint32_t>& indices() const { return indices_; }
    const std::string& pool() const { return pool_; }
    const std::vector<std::uint64_t>& ends() const { return ends_; }

private:
    std::vector<std::uint32_t> indices_;
    std::string pool_;
    std::vector<std::uint64_t> ends_;
    std::unordered_map<std::string, std::uint32_t> numbers_;
};

/// Takes one type of value all along.
class EntryColumn {
public:
    EntryColumn(const char* name, ZulmColumnType type) : name_(name), type_(type) {}

    void add(std::int32_t value) { numbers_.push_back(value); }
    void add(std::uint32_t value) { unsignedNumbers_.push_back(value); }
    void add(std::uint64_t value) { identifiers_.push_back(value); }
    void add(float value);
    void add(double value) { reals_.push_back(value); }
    void add(const std::string& text);
    void add(const CursorImage& cursor); ///< its encoded image

    /// Valid until something is added.
    ZulmColumn view() const;

private:
    const char* name_;
    ZulmColumnType type_;
    std::vector<std::int32_t> numbers_;
    std::vector<std::uint32_t> unsignedNumbers_;
    std::vector<std::uint64_t> identifiers_;
    std::vector<double> reals_;
    DistinctValues values_;
};

} // namespace ZULMetaData::Bindings
