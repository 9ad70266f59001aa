#pragma once

// What a parser gives to the application: entries as lists of named values.
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

/// What an entry holds under one key; each parser says of which types the values of its keys are.
using EntryValue = std::variant<std::int32_t, std::int64_t, float, std::string, std::shared_ptr<const Image>>;

/// Whether an `EntryValue` can hold a `T`.
template <class T>
inline constexpr bool isEntryValueType =
    std::is_same_v<T, std::int32_t> || std::is_same_v<T, std::int64_t> || std::is_same_v<T, float> ||
    std::is_same_v<T, std::string> || std::is_same_v<T, std::shared_ptr<const Image>>;

/// What most kinds of entry consist of. A fifth of the size of an `EntryValue`.
using EntryNumber = std::variant<std::int32_t, float>;

/// The keys of one kind of entry, in the order of its values.
using EntryKeys = std::vector<std::string>;

/// One decoded entry: a small map whose order is that of its kind's keys. Constant entries may be read by several
/// threads.
///
/// Hours of recording make millions of entries, nearly all of them numbers: those are kept inline, 56 bytes in all, and
/// become `EntryValue`s only where somebody asks for one.
class ZULMETADATA_API EntryDictionary {
public:
    static constexpr std::size_t maxSize = 5; ///< keys of an entry, "timestamp" included

    /// In the order of the keys; what is left over behind them is unused.
    using Values = std::array<EntryValue, maxSize>;
    using Numbers = std::array<EntryNumber, maxSize>;                    ///< likewise
    using value_type = std::pair<const std::string&, const EntryValue&>; ///< key and value, valid as long as the entry
    class const_iterator;

    /// `keys` must outlive the entry; `values` are its values in the same order, at most `maxSize`.
    EntryDictionary(const EntryKeys& keys, Values values);

    /// The same for an entry of numbers alone; allocates nothing.
    static EntryDictionary ofNumbers(const EntryKeys& keys, const Numbers& numbers) noexcept {
        EntryDictionary entry(keys);
        entry.numbers_ = numbers;
        return entry;
    }

    EntryDictionary(const EntryDictionary& other); ///< shares the keys

    /// Leaves `other` with its keys, whose values then mean nothing.
    EntryDictionary(EntryDictionary&& other) noexcept
        : keys_(other.keys_), numbers_(other.numbers_), values_(other.values_.load(std::memory_order_relaxed)) {
        other.values_.store(nullptr, std::memory_order_relaxed);
    }
    EntryDictionary& operator=(EntryDictionary other) noexcept; ///< copies or moves, as `other` was made
    ~EntryDictionary() {
        if (values_.load(std::memory_order_relaxed))
            deleteValues();
    }

    /// Throws `std::out_of_range` for a key that the entry lacks. Valid as long as the entry.
    const EntryValue& at(std::string_view key) const;

    /// Throws as `at` does, and `std::bad_variant_access` where the value is of another type.
    template <class T>
    T get(std::string_view key) const;

    const_iterator find(std::string_view key) const;   ///< `end()` where the entry lacks the key
    bool contains(std::string_view key) const;         ///< the same for every entry of a kind
    std::size_t size() const { return keys_->size(); } ///< "timestamp" included
    const_iterator begin() const;                      ///< at the kind's first key
    const_iterator end() const;                        ///< behind "timestamp"

private:
    explicit EntryDictionary(const EntryKeys& keys) noexcept : keys_(&keys) {}

    template <class T>
    T valueAt(std::string_view key) const;
    std::size_t indexOf(std::string_view key) const;
    const Values& values() const;
    value_type pairAt(std::size_t index) const;
    void deleteValues() noexcept;

    const EntryKeys* keys_;
    Numbers numbers_{};                                   // where there are no values
    mutable std::atomic<const Values*> values_ = nullptr; // owned
};

/// What `read` of a parser gives: the entries of a stream, in its order.
using EntryList = std::vector<EntryDictionary>;

/// Gives pairs of key and value.
class EntryDictionary::const_iterator {
public:
    /// What algorithms ask of an iterator that makes its pairs as it goes.
    ///@{
    using iterator_category = std::input_iterator_tag;
    using value_type = EntryDictionary::value_type;
    using difference_type = std::ptrdiff_t;
    using reference = value_type;
    ///@}

    /// Keeps the pair that `->` gives access to.
    struct pointer {
        value_type pair;                                       ///< refers into the entry
        const value_type* operator->() const { return &pair; } ///< valid as long as the pair
    };

    const_iterator() = default;

    /// At the key of number `index`, counted from 0.
    const_iterator(const EntryDictionary& entry, std::size_t index) : entry_(&entry), index_(index) {}

    /// As of any input iterator. What they give refers into the entry.
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
