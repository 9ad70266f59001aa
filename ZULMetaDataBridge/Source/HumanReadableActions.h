#pragma once

// Texts for recorded actions, such as "left down + shift" or "<Shift><Cmd>".

#include "../../SharedDependencies/Export.h"

#include <string>

namespace ZULMetaData {

/// Returns the texts for the numbers of actions and keys.
struct ZULMETADATA_API HumanReadableActions {
    /// Returns whether all bits of `flag` are set in `value`. Throws `std::invalid_argument` "Flag should not be
    /// empty." if `flag` is 0.
    static bool HasFlag(int value, int flag);

    /// Returns a text such as "left down" or "right up + cmd". Bits 16 and 32 mean the middle button if no bit of the
    /// left or right button is set, and Shift and Control otherwise. If there is no button, the text is the number.
    static std::string CursorActionToString(int action);

    /// Returns the name of a virtual-key code. For a code without a name, returns the low 8 bits as a single byte,
    /// which may be invalid UTF-8, or an empty text if that byte is white space.
    static std::string KeyboardActionCodeToString(int code);

    /// Returns a text such as "<Shift><Cmd>", or "NONE" if no known bit is set.
    static std::string KeyboardModifiersToString(int flags);
};

} // namespace ZULMetaData
