#pragma once

// What a recorded key is called.
//
//     keyNameOf({'w', 0}).text;          // "w": a code without the flag (IsVK) is a character
//     keyNameOf({119, 0x40000000}).text; // "f8": a code with it is a virtual key
//
// `HumanReadableActions::KeyboardActionCodeToString`, which fills the entries of a parser, looks at the code alone and
// therefore takes many letters for keys.

#include "../../SharedDependencies/Export.h"
#include "../../ZULMetaData/ZULMMetaDataCommon.h"

#include <string>

namespace ZULMetaData {

/// What the code of a key stands for.
enum class KeyMeaning {
    Character, ///< a character that the key has typed
    Key,       ///< a key that has a name
    Number,    ///< neither: a key without a name, or a number that is no character
};

/// The name of a recorded key.
struct KeyName {
    KeyMeaning meaning; ///< what the text names
    std::string text;   ///< UTF-8: the character, the key's name such as "returnKey", or "key 200"
};

/// Returns the name of a key by its code and its flags. If the flag (IsVK) is not set, the code is a Unicode code
/// point; control characters such as 13 are the keys that type them. If it is set, the code is a virtual key.
ZULMETADATA_API KeyName keyNameOf(const KeyStroke& key);

/// Returns whether the flag (IsVK) is set.
ZULMETADATA_API bool isVirtualKey(const KeyStroke& key);

} // namespace ZULMetaData
