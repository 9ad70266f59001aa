#pragma once

// The tables that programs in other languages can ask for. The names of their columns are the same in all of them.

#include "Bindings/Tables/Table.h"
#include "ZULMetaDataSession/EditList.h"
#include "ZULMetaDataSession/Recording.h"

#include <functional>
#include <map>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::Bindings {

/// Returns what holds at each of these times. Nothing is known of a stream that cannot be decoded.
Table statesTable(const Recording& recording, std::span<const double> times, Interpolation interpolation);

/// Parameters of insights by their names, such as {"idle_least", 3}.
using InsightParameters = std::map<std::string, double, std::less<>>;

/// Returns "clicks", "captions", "idle", "chapters", "zooms", "cursor_path", "camera", "activity" or "applications".
/// Throws `std::invalid_argument` for another name and for a parameter that the table does not have.
Table insightTable(const Recording& recording, std::string_view name, const InsightParameters& parameters);

std::vector<const char*> insightNames(); ///< in the order above

/// One row for each stream of the edited recording, with its bytes. The times mean nothing.
Table retimedTable(const Recording& recording, const EditList& edits);

} // namespace ZULMetaData::Bindings
