#include "ZULMetaDataBridge/Source/EntryDictionary.h"

#include <algorithm>
#include <stdexcept>

namespace ZULMetaData {

namespace {

EntryValue valueOf(const EntryNumber& number) {
    return std::visit([](auto value) { return EntryValue(value); }, number);
}

} // namespace

EntryDictionary::EntryDictionary(const EntryKeys& keys, Values values)
    : keys_(&keys), values_(new Values(std::move(values))) {}

EntryDictionary::EntryDictionary(const EntryDictionary& other) : keys_(other.keys_), numbers_(other.numbers_) {
    if (const Values* values = other.values_.load(std::memory_order_acquire))
        values_ = new Values(*values);
}

EntryDictionary& EntryDictionary::operator=(EntryDictionary other) noexcept {
    keys_ = other.keys_;
    numbers_ = other.numbers_;
    other.values_ = values_.exchange(other.values_);
    return *this;
}

const EntryValue& EntryDictionary::at(std::string_view key) const {
    return values()[indexOf(key)];
}

EntryDictionary::const_iterator EntryDictionary::find(std::string_view key) const {
    const auto found = std::find(keys_->begin(), keys_->end(), key);
    return {*this, static_cast<std::size_t>(found - keys_->begin())};
}

bool EntryDictionary::contains(std::string_view key) const {
    return find(key) != end();
}

EntryDictionary::const_iterator EntryDictionary::begin() const {
    return {*this, 0};
}

EntryDictionary::const_iterator EntryDictionary::end() const {
    return {*this, size()};
}

std::size_t EntryDictionary::indexOf(std::string_view key) const {
    const auto found = std::find(keys_->begin(), keys_->end(), key);
    if (found == keys_->end())
        throw std::out_of_range("no value for key " + std::string(key));
    return static_cast<std::size_t>(found - keys_->begin());
}

template <class T>
T EntryDictionary::valueAt(std::string_view key) const {
    if constexpr (std::is_same_v<T, std::int32_t> || std::is_same_v<T, float>)
        if (!values_.load(std::memory_order_acquire))
            return std::get<T>(numbers_[indexOf(key)]);
    return std::get<T>(at(key));
}

template std::int32_t EntryDictionary::valueAt(std::string_view key) const;
template std::int64_t EntryDictionary::valueAt(std::string_view key) const;
template float EntryDictionary::valueAt(std::string_view key) const;
template std::string EntryDictionary::valueAt(std::string_view key) const;
template std::shared_ptr<const Image> EntryDictionary::valueAt(std::string_view key) const;

/// If two threads make them at once, the entry keeps those that are finished first.
const EntryDictionary::Values& EntryDictionary::values() const {
    const Values* values = values_.load(std::memory_order_acquire);
    if (values)
        return *values;
    auto made = std::make_unique<Values>();
    std::transform(numbers_.begin(), numbers_.end(), made->begin(), valueOf);
    if (values_.compare_exchange_strong(values, made.get(), std::memory_order_acq_rel))
        values = made.release();
    return *values;
}

EntryDictionary::value_type EntryDictionary::pairAt(std::size_t index) const {
    return {(*keys_)[index], values()[index]};
}

void EntryDictionary::deleteValues() noexcept {
    delete values_.load(std::memory_order_relaxed);
}

} // namespace ZULMetaData
