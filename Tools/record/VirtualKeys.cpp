#include "Tools/record/VirtualKeys.h"

#include <xkbcommon/xkbcommon-keysyms.h>

#include <algorithm>
#include <array>

namespace Recorder {

using ZULMetaData::VirtualKey;

namespace {

struct Row {
    xkb_keysym_t symbol;
    VirtualKey key;
};

/// Keys of the usual table of codes that have no name in the vocabulary.
constexpr VirtualKey key(std::uint32_t code) {
    return static_cast<VirtualKey>(code);
}

constexpr std::array s_keys{
    Row{XKB_KEY_BackSpace, VirtualKey::Back},
    Row{XKB_KEY_Tab, VirtualKey::Tab},
    Row{XKB_KEY_KP_Tab, VirtualKey::Tab},
    Row{XKB_KEY_ISO_Left_Tab, VirtualKey::Tab},
    Row{XKB_KEY_Clear, VirtualKey::Clear},
    Row{XKB_KEY_KP_Begin, VirtualKey::Clear},
    Row{XKB_KEY_Return, VirtualKey::Return},
    Row{XKB_KEY_KP_Enter, VirtualKey::Return},
    Row{XKB_KEY_ISO_Enter, VirtualKey::Return},
    Row{XKB_KEY_Linefeed, VirtualKey::Return},
    Row{XKB_KEY_Pause, VirtualKey::Pause},
    Row{XKB_KEY_Break, VirtualKey::Cancel},
    Row{XKB_KEY_Cancel, VirtualKey::Cancel},
    Row{XKB_KEY_Escape, VirtualKey::Escape},
    Row{XKB_KEY_Prior, VirtualKey::Prior},
    Row{XKB_KEY_KP_Prior, VirtualKey::Prior},
    Row{XKB_KEY_Next, VirtualKey::Next},
    Row{XKB_KEY_KP_Next, VirtualKey::Next},
    Row{XKB_KEY_End, VirtualKey::End},
    Row{XKB_KEY_KP_End, VirtualKey::End},
    Row{XKB_KEY_Home, VirtualKey::Home},
    Row{XKB_KEY_KP_Home, VirtualKey::Home},
    Row{XKB_KEY_Begin, VirtualKey::Home},
    Row{XKB_KEY_Left, VirtualKey::Left},
    Row{XKB_KEY_KP_Left, VirtualKey::Left},
    Row{XKB_KEY_Up, VirtualKey::Up},
    Row{XKB_KEY_KP_Up, VirtualKey::Up},
    Row{XKB_KEY_Right, VirtualKey::Right},
    Row{XKB_KEY_KP_Right, VirtualKey::Right},
    Row{XKB_KEY_Down, VirtualKey::Down},
    Row{XKB_KEY_KP_Down, VirtualKey::Down},
    Row{XKB_KEY_Select, VirtualKey::Select},
    Row{XKB_KEY_Execute, VirtualKey::Execute},
    Row{XKB_KEY_Print, VirtualKey::Snapshot},
    Row{XKB_KEY_Sys_Req, VirtualKey::Snapshot},
    Row{XKB_KEY_Insert, VirtualKey::Insert},
    Row{XKB_KEY_KP_Insert, VirtualKey::Insert},
    Row{XKB_KEY_Delete, VirtualKey::Delete},
    Row{XKB_KEY_KP_Delete, VirtualKey::Delete},
    Row{XKB_KEY_Help, VirtualKey::Help},
    Row{XKB_KEY_Menu, key(93)},
    Row{XKB_KEY_KP_F1, VirtualKey::F1},
    Row{XKB_KEY_KP_F2, VirtualKey::F2},
    Row{XKB_KEY_KP_F3, VirtualKey::F3},
    Row{XKB_KEY_KP_F4, VirtualKey::F4},
    Row{XKB_KEY_XF86AudioMute, key(173)},
    Row{XKB_KEY_XF86AudioLowerVolume, key(174)},
    Row{XKB_KEY_XF86AudioRaiseVolume, key(175)},
    Row{XKB_KEY_XF86AudioNext, key(176)},
    Row{XKB_KEY_XF86AudioPrev, key(177)},
    Row{XKB_KEY_XF86AudioStop, key(178)},
    Row{XKB_KEY_XF86AudioPlay, key(179)},
    Row{XKB_KEY_XF86Back, key(166)},
    Row{XKB_KEY_XF86Forward, key(167)},
    Row{XKB_KEY_XF86Refresh, key(168)},
    Row{XKB_KEY_XF86Sleep, key(95)},
};

} // namespace

VirtualKey virtualKeyOf(xkb_keysym_t symbol) {
    if (symbol >= XKB_KEY_F1 && symbol <= XKB_KEY_F24)
        return key(static_cast<std::uint32_t>(VirtualKey::F1) + symbol - XKB_KEY_F1);
    const auto row = std::find_if(s_keys.begin(), s_keys.end(),
                                  [symbol](const Row& candidate) { return candidate.symbol == symbol; });
    return row == s_keys.end() ? VirtualKey::Unknown : row->key;
}

bool isModifierKey(xkb_keysym_t symbol) {
    return (symbol >= XKB_KEY_Shift_L && symbol <= XKB_KEY_Hyper_R) ||
           (symbol >= XKB_KEY_ISO_Lock && symbol <= XKB_KEY_ISO_Level5_Lock && symbol != XKB_KEY_ISO_Left_Tab) ||
           symbol == XKB_KEY_Mode_switch || symbol == XKB_KEY_Num_Lock || symbol == XKB_KEY_Scroll_Lock;
}

char32_t characterOf(xkb_keysym_t symbol) {
    const char32_t character = xkb_keysym_to_utf32(symbol);
    const bool isControl = character < 0x20 || (character >= 0x7f && character < 0xa0);
    return isControl ? 0 : character;
}

} // namespace Recorder
