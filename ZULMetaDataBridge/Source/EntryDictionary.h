#pragma once

// What a parser gives to the application: entries as lists of named values.
//
//     for (const EntryDictionary& entry : *parser.read())
//         std::cout << entry.get<std::int32_t>("x") << " at " << entry.get<float>("timestamp") << '\n';

#include <array>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

namespace ZULMetaData {

class Image;

using EntryValue = std::variant<std::int32_t, std::int64_t, float, std::string, std::shared_ptr<const Image>>;

/// The keys of one kind of entry, in the order of its values.
using EntryKeys = std::vector<std::string>;

/// One decoded entry: a small map whose order is that of its kind's keys.
class EntryDictionary {
public:
    static constexpr std::size_t maxSize = 5;
    using value_type = std::pair<const std::string&, const EntryValue&>;
    class const_iterator;

    /// `keys` must outlive the entry; `values` are its values in the same order, at most `maxSize`.
    EntryDictionary(const EntryKeys& keys, std::array<EntryValue, maxSize> values)
        : keys_(&keys), values_(std::move(values)) {}

    /// Throws `std::out_of_range` for a key that the entry lacks.
    const EntryValue& at(std::string_view key) const;

    /// Throws as `at` does, and `std::bad_variant_access` where the value is of another type.
    template <class T>
    T get(std::string_view key) const {
        return std::get<T>(at(key));
    }

    const_iterator find(std::string_view key) const;
    bool contains(std::string_view key) const;
    std::size_t size() const { return keys_->size(); }
    const_iterator begin() const;
    const_iterator end() const;

private:
    const EntryKeys* keys_;
    std::array<EntryValue, maxSize> values_;
};

using EntryList = std::vector<EntryDictionary>;

/// Gives pairs of key and value.
class EntryDictionary::const_iterator {
public:
    using iterator_category = std::input_iterator_tag;
    using value_type = EntryDictionary::value_type;
    using difference_type = std::ptrdiff_t;
    using reference = value_type;

    struct pointer {
        value_type pair;
        const value_type* operator->() const { return &pair; }
    };

    const_iterator() = default;
    const_iterator(const EntryDictionary& entry, std::size_t index) : entry_(&entry), index_(index) {}

    reference operator*() const { return {(*entry_->keys_)[index_], entry_->values_[index_]}; }
    pointer operator->() const { return {**this}; }
    const_iterator& operator++() {
        ++index_;
        return *this;
    }
    const_iterator operator++(int) { return std::exchange(*this, {*entry_, index_ + 1}); }
    friend bool operator==(const const_iterator&, const const_iterator&) = default;

private:
    const EntryDictionary* entry_ = nullptr;
    std::size_t index_ = 0;
};

} // namespace ZULMetaData
