#pragma once

// The fields of an entry with the values that are stored, for programs that show all of them. An `EntryDictionary` has
// the same keys, but narrows its numbers, ends texts at their first zero byte and knows a key by its code alone.
//
//     visitStoredFields<CursorLocationKind>(point, [](const char* key, std::int32_t number) {
//         std::cout << key << '=' << number << '\n';
//     });

#include "EntryTexts.h"
#include "KeyNames.h"
#include "MetaDataKinds.h"

#include <concepts>
#include <cstddef>
#include <iterator>
#include <list>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>

namespace ZULMetaData {

namespace detail {

/// Returns the field of this number.
template <class Kind, std::size_t Index>
decltype(auto) storedField(const typename Kind::Value& value) {
    using Value = typename Kind::Value;
    constexpr const auto& field = std::get<Index>(Kind::fields);
    using Result = std::remove_cvref_t<std::invoke_result_t<decltype(field.valueOf), const Value&>>;
    if constexpr (std::same_as<Value, std::string> || std::same_as<Result, EntryValue>)
        return (value);
    else if constexpr (std::same_as<Value, std::list<std::string>>)
        return value.size() > Index ? utf8FromLatin1(*std::next(value.begin(), Index)) : std::string();
    else if constexpr (std::is_convertible_v<decltype(field.valueOf), std::string (*)(const KeyStroke&)>)
        return field.valueOf == keyText ? keyNameOf(value).text : field.valueOf(value);
    else
        return Result(valueOfField(field, value));
}

} // namespace detail

/// Calls `visit` with the key and the stored value of every field of the kind, in their order. A value is an integer or
/// a real number of the type that is stored; a text; or, for the image of a cursor, the cursor. Texts of a list are
/// converted from ISO 8859-1, and are empty if the list ends before them. Other texts are the stored bytes.
template <class Kind, class Visit>
void visitStoredFields(const typename Kind::Value& value, Visit visit) {
    [&]<std::size_t... Index>(std::index_sequence<Index...>) {
        (visit(std::get<Index>(Kind::fields).key, detail::storedField<Kind, Index>(value)), ...);
    }
    (std::make_index_sequence<std::tuple_size_v<decltype(Kind::fields)>>());
}

} // namespace ZULMetaData
