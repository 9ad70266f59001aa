#pragma once

#include "ZULMetaDataBridge/Source/InputVocabulary.h"

#include <xkbcommon/xkbcommon.h>

namespace Recorder {

/// Returns the virtual key of a keysym that types no character; `Unknown` if there is none.
ZULMetaData::VirtualKey virtualKeyOf(xkb_keysym_t symbol);

/// Returns whether a keysym is that of a modifier, a lock, or a switch of groups, which are no keys of their own.
bool isModifierKey(xkb_keysym_t symbol);

/// Returns the character that a keysym types; 0 if it types none.
char32_t characterOf(xkb_keysym_t symbol);

} // namespace Recorder
