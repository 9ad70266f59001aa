#pragma once

// The tables that programs in other languages can ask for. The names of their columns are the same in all of them.

#include "Bindings/Tables/Table.h"
#include "ZULMetaDataSession/Recording.h"

#include <functional>
#include <map>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace ZULMetaData::Bindings {

/// Returns what holds at each of these times. Nothing is known of a stream that cannot be decoded, which is a warning.
Table statesTable(const Recording& recording, std::span<const double> times, Interpolation interpolation);

/// Parameters of insights by their names, such as {"idle_least", 3}.
using InsightParameters = std::map<std::string, double, std::less<>>;

/// Returns "clicks", "captions", "idle", "chapters", "zooms", "cursor_path", "cursor_speed", "camera", "activity" or
/// "applications". Throws `std::invalid_argument` for another name and for a parameter that the table does not have.
Table insightTable(const Recording& recording, std::string_view name, const InsightParameters& parameters);

std::vector<const char*> insightNames(); ///< in the order above

/// The text of an edit list, in any form that `EditList::open` reads.
struct EditText {
    std::string text;
    std::string name = "edits"; ///< what errors call it; its extension says the form if the text does not
    std::string frameRate = {}; ///< such as "30000/1001", for lists that count frames; may be empty
};

/// Returns one row for each stream of the edited recording, with its bytes. The times mean nothing. Throws `Error` if
/// the text is not an edit list.
Table retimedTable(const Recording& recording, const EditText& edits);

} // namespace ZULMetaData::Bindings
