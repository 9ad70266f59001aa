#pragma once

// What the session layer computes, as columns for languages that think in arrays.

#include "ZULMetaDataSession/TrackValues.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <variant>
#include <vector>

namespace ZULMetaData::Bindings {

using Text = std::optional<std::string>;                       ///< bytes as they are stored; empty if nothing is known
using Blob = std::shared_ptr<const std::vector<std::uint8_t>>; ///< null if there is none; rows share them

/// One value for every row.
struct TableColumn {
    const char* name;
    std::variant<std::vector<double>, std::vector<std::int32_t>, std::vector<std::uint64_t>, std::vector<Text>,
                 std::vector<Blob>>
        values;
};

/// Rows in the order of their times. Numbers that are not known are not a number.
struct Table {
    std::vector<double> times; ///< in seconds
    std::vector<TableColumn> columns;
    std::vector<std::string> warnings; ///< sentences about what is missing because of the file

    /// Adds the column of `valueOf(row)`.
    template <class Rows, class ValueOf>
    void add(const char* name, const Rows& rows, ValueOf valueOf) {
        using Value = std::decay_t<decltype(valueOf(*rows.begin()))>;
        std::vector<Value> values;
        values.reserve(rows.size());
        for (const auto& row : rows)
            values.push_back(valueOf(row));
        columns.push_back({name, std::move(values)});
    }
};

} // namespace ZULMetaData::Bindings
