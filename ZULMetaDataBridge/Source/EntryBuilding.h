#pragma once

// Converts decoded values into entries, along the fields of their kind.

#include "EntryDictionary.h"
#include "MetaDataKinds.h"

#include <concepts>
#include <cstdint>
#include <tuple>
#include <type_traits>
#include <variant>

namespace ZULMetaData {

/// A type whose values are stored in an entry as numbers of 32 bits.
template <class Value>
concept NumberField = OneOf < std::remove_cvref_t<Value>,
        std::int32_t, std::uint32_t,
float, double > ;

/// Returns the number in the form in which an entry of numbers holds it.
template <NumberField Value>
EntryNumber entryNumber(Value value) {
    if constexpr (std::integral<Value>)
        return static_cast<std::int32_t>(value);
    else
        return static_cast<float>(value);
}

/// Returns the value in the form in which an entry holds it. Unsigned integers keep their bits; floating-point numbers
/// are narrowed to 32 bits.
template <class Value>
EntryValue entryValue(Value value) {
    if constexpr (NumberField<Value>)
        return std::visit([](auto number) { return EntryValue(number); }, entryNumber(value));
    else if constexpr (std::same_as<Value, std::uint64_t>)
        return static_cast<std::int64_t>(value);
    else
        return value;
}

/// Returns the keys of the fields of a kind, followed by "timestamp".
template <class Kind>
const EntryKeys& entryKeys() {
    static const EntryKeys& keys = *new EntryKeys(std::apply( // never destroyed: entries may outlive the program's end
        [](const auto&... field) {
            return EntryKeys{field.key..., "timestamp"};
        },
        Kind::fields));
    return keys;
}

/// Returns the entry of a value. `time` is narrowed to 32 bits. Exceptions of the kind's fields pass through; they
/// throw for a value that has no valid text.
template <class Kind>
EntryDictionary makeEntry(double time, const typename Kind::Value& value) {
    static_assert(std::tuple_size_v<decltype(Kind::fields)> < EntryDictionary::maxSize);
    const auto build = [&](const auto&... field) -> EntryDictionary {
        const EntryKeys& keys = entryKeys<Kind>();
        if constexpr ((NumberField<decltype(valueOfField(field, value))> && ...))
            return EntryDictionary::ofNumbers(keys, {entryNumber(valueOfField(field, value))..., entryNumber(time)});
        else
            return {keys, {entryValue(valueOfField(field, value))..., entryValue(time)}};
    };
    return std::apply(build, Kind::fields);
}

} // namespace ZULMetaData
