#pragma once

#include <string_view>

namespace Render {

/// The styles that ship: the JSON documents of the folder styles.
///@{
extern const std::string_view s_plainStyle;
extern const std::string_view s_productStyle;
///@}

} // namespace Render
