#pragma once

// Decimal numbers as JSON writes them ("-12.5e3"), as fractions.

#include "ZULMetaDataSession/Rational.h"

#include <optional>
#include <string_view>

namespace ZULMetaData::detail {

/// Returns exactly this number. Empty if it has more than 400 places before or after its point.
std::optional<Rational> exactDecimal(std::string_view number);

/// Returns the double that is nearest to this number. Empty if that is infinite.
std::optional<Rational> nearestDouble(std::string_view number);

} // namespace ZULMetaData::detail
