#pragma once

// The entries that parsers return: small maps of named values.
//
//     for (const EntryDictionary& entry : *parser.read())
//         std::cout << entry.get<std::int32_t>("x") << " at " << entry.get<float>("timestamp") << '\n';

#include "../../SharedDependencies/Export.h"

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <memory>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <variant>
#include <vector>

namespace ZULMetaData {

class Image;

/// A value in an entry. Each parser documents the types of its values.
using EntryValue = std::variant<std::int32_t, std::int64_t, float, std::string, std::shared_ptr<const Image>>;

/// Is true if an `EntryValue` can hold a `T`.
template <class T>
inline constexpr bool isEntryValueType =
    std::is_same_v<T, std::int32_t> || std::is_same_v<T, std::int64_t> || std::is_same_v<T, float> ||
    std::is_same_v<T, std::string> || std::is_same_v<T, std::shared_ptr<const Image>>;

/// A number in an entry. Most entries have only numbers. It takes a fifth of the memory of an `EntryValue`.
using EntryNumber = std::variant<std::int32_t, float>;

/// The keys of the entries of one kind, in the order of their values.
using EntryKeys = std::vector<std::string>;

/// A decoded entry: a small map in the order of the keys of its kind. Several threads may read the same constant entry.
///
/// A recording of some hours has millions of entries, and nearly all of them have only numbers. Such an entry keeps its
/// numbers in the object itself, 56 bytes in all. They become `EntryValue`s when one is asked for.
class ZULMETADATA_API EntryDictionary {
public:
    static constexpr std::size_t maxSize = 5; ///< the largest number of keys, "timestamp" included

    /// Values in the order of the keys. The rest of the array is not used.
    using Values = std::array<EntryValue, maxSize>;
    /// Numbers in the order of the keys. The rest of the array is not used.
    using Numbers = std::array<EntryNumber, maxSize>;
    using value_type =
        std::pair<const std::string&, const EntryValue&>; ///< a key and its value, valid as long as the entry
    class const_iterator;

    /// Creates an entry of these values, which are in the order of `keys`. `keys` must outlive the entry.
    EntryDictionary(const EntryKeys& keys, Values values);

    /// Returns an entry that has only numbers. Allocates no memory.
    static EntryDictionary ofNumbers(const EntryKeys& keys, const Numbers& numbers) noexcept {
        EntryDictionary entry(keys);
        entry.numbers_ = numbers;
        return entry;
    }

    EntryDictionary(const EntryDictionary& other); ///< copies the values and refers to the same keys

    /// Takes the values. `other` keeps its keys, but its values mean nothing afterwards.
    EntryDictionary(EntryDictionary&& other) noexcept
        : keys_(other.keys_), numbers_(other.numbers_), values_(other.values_.load(std::memory_order_relaxed)) {
        other.values_.store(nullptr, std::memory_order_relaxed);
    }
    EntryDictionary& operator=(EntryDictionary other) noexcept; ///< assigns by copy or by move
    ~EntryDictionary() {
        if (values_.load(std::memory_order_relaxed))
            deleteValues();
    }

    /// Returns the value of the key, which is valid as long as the entry. Throws `std::out_of_range` if the entry does
    /// not have the key.
    const EntryValue& at(std::string_view key) const;

    /// Returns the value of the key as a `T`, one of the types of `EntryValue`. Throws `std::out_of_range` if the entry
    /// does not have the key, and `std::bad_variant_access` if the value has another type.
    template <class T>
    T get(std::string_view key) const;

    const_iterator find(std::string_view key) const;   ///< returns `end()` if the entry does not have the key
    bool contains(std::string_view key) const;         ///< returns whether the entry has the key
    std::size_t size() const { return keys_->size(); } ///< returns the number of keys, "timestamp" included
    const_iterator begin() const;                      ///< returns an iterator to the first key
    const_iterator end() const;                        ///< returns the iterator after "timestamp"

private:
    explicit EntryDictionary(const EntryKeys& keys) noexcept : keys_(&keys) {}

    template <class T>
    T valueAt(std::string_view key) const;
    std::size_t indexOf(std::string_view key) const;
    const Values& values() const;
    value_type pairAt(std::size_t index) const;
    void deleteValues() noexcept;

    const EntryKeys* keys_;
    Numbers numbers_{};                                   // used if there are no values
    mutable std::atomic<const Values*> values_ = nullptr; // owned
};

/// The entries of a stream, in its order. Parsers return such lists.
using EntryList = std::vector<EntryDictionary>;

/// Iterates over the pairs of key and value.
class EntryDictionary::const_iterator {
public:
    /// The types that algorithms need from an iterator.
    ///@{
    using iterator_category = std::input_iterator_tag;
    using value_type = EntryDictionary::value_type;
    using difference_type = std::ptrdiff_t;
    using reference = value_type;
    ///@}

    /// Holds a pair for `operator->`.
    struct pointer {
        value_type pair; ///< the pair, which refers into the entry
        const value_type* operator->() const {
            return &pair;
        } ///< returns a pointer that is valid as long as this object
    };

    const_iterator() = default;

    /// Creates an iterator to the key at `index`, counted from 0.
    const_iterator(const EntryDictionary& entry, std::size_t index) : entry_(&entry), index_(index) {}

    /// The operations of an input iterator. Their results refer into the entry.
    ///@{
    reference operator*() const { return entry_->pairAt(index_); }
    pointer operator->() const { return {**this}; }
    const_iterator& operator++() {
        ++index_;
        return *this;
    }
    const_iterator operator++(int) { return std::exchange(*this, {*entry_, index_ + 1}); }
    friend bool operator==(const const_iterator&, const const_iterator&) = default;
    ///@}

private:
    const EntryDictionary* entry_ = nullptr;
    std::size_t index_ = 0;
};

template <class T>
T EntryDictionary::get(std::string_view key) const {
    static_assert(isEntryValueType<T>, "get<T>: an entry holds std::int32_t, std::int64_t, float, std::string and "
                                       "std::shared_ptr<const Image>; T must be one of these");
    if constexpr (isEntryValueType<T>) // otherwise the linker would complain as well
        return valueAt<T>(key);
    else
        throw std::bad_variant_access();
}

extern template ZULMETADATA_API std::int32_t EntryDictionary::valueAt(std::string_view key) const;
extern template ZULMETADATA_API std::int64_t EntryDictionary::valueAt(std::string_view key) const;
extern template ZULMETADATA_API float EntryDictionary::valueAt(std::string_view key) const;
extern template ZULMETADATA_API std::string EntryDictionary::valueAt(std::string_view key) const;
extern template ZULMETADATA_API std::shared_ptr<const Image> EntryDictionary::valueAt(std::string_view key) const;

} // namespace ZULMetaData
