#include "Tools/record/KeyObserver.h"

#include "Tools/record/Failure.h"
#include "Tools/record/VirtualKeys.h"

// A field of the extension's header has a name that C++ reserves.
#ifdef __clang__
#pragma clang diagnostic push
#pragma clang diagnostic ignored "-Wkeyword-macro"
#endif
#define explicit explicit_
#ifdef __clang__
#pragma clang diagnostic pop
#endif
#include <xcb/xkb.h>
#undef explicit
#include <xkbcommon/xkbcommon-x11.h>

#include <cstdlib>
#include <string>
#include <vector>

namespace Recorder {

using namespace ZULMetaData;

namespace {

struct RealModifier {
    Modifier modifier;
    const char* name; ///< of the keyboard map
};

constexpr RealModifier s_realModifiers[] = {
    {Modifier::CapsLock, XKB_MOD_NAME_CAPS}, {Modifier::Shift, XKB_MOD_NAME_SHIFT},
    {Modifier::Control, XKB_MOD_NAME_CTRL},  {Modifier::Alt, XKB_MOD_NAME_ALT},
    {Modifier::Windows, XKB_MOD_NAME_LOGO},
};

constexpr Modifiers s_chordModifiers{Modifier::Control, Modifier::Alt, Modifier::Windows};

bool hasCommon(Modifiers left, Modifiers right) {
    return (left.bits() & right.bits()) != 0;
}

bool isDigit(char32_t character) {
    return character >= '0' && character <= '9';
}

/// The code of a letter or a digit; 0 for other characters.
std::uint32_t virtualKeyOfCharacter(char32_t character) {
    if (character >= 'a' && character <= 'z')
        return static_cast<std::uint32_t>(character - 'a' + 'A');
    return isDigit(character) || (character >= 'A' && character <= 'Z') ? static_cast<std::uint32_t>(character) : 0;
}

std::string nonEmpty(const char* variable) {
    const char* value = std::getenv(variable);
    return value ? value : "";
}

/// Returns the names of the locales to look for rules of dead keys in.
std::vector<std::string> locales() {
    std::vector<std::string> names;
    for (const char* variable : {"LC_ALL", "LC_CTYPE", "LANG"})
        if (const std::string name = nonEmpty(variable); !name.empty()) {
            names.push_back(name);
            break;
        }
    if (!names.empty() && (names[0] == "C" || names[0] == "POSIX" || names[0] == "C.UTF-8"))
        names.clear();
    names.emplace_back("en_US.UTF-8");
    return names;
}

} // namespace

KeyObserver::KeyObserver(XConnection& connection, const ServerClock& clock, HeldInput& input, PrivacyFilter& privacy)
    : connection_(connection), clock_(clock), input_(input), privacy_(privacy),
      context_(xkb_context_new(XKB_CONTEXT_NO_FLAGS)) {
    const int isThere =
        xkb_x11_setup_xkb_extension(connection_.get(), XKB_X11_MIN_MAJOR_XKB_VERSION, XKB_X11_MIN_MINOR_XKB_VERSION,
                                    XKB_X11_SETUP_XKB_EXTENSION_NO_FLAGS, nullptr, nullptr, &firstEvent_, nullptr);
    if (!isThere || !context_)
        throw Refusal("the X display has no keyboard extension (XKB), without which keys cannot be recorded");
    device_ = xkb_x11_get_core_keyboard_device_id(connection_.get());
    constexpr std::uint16_t events =
        XCB_XKB_EVENT_TYPE_NEW_KEYBOARD_NOTIFY | XCB_XKB_EVENT_TYPE_MAP_NOTIFY | XCB_XKB_EVENT_TYPE_STATE_NOTIFY;
    constexpr std::uint16_t mapParts = XCB_XKB_MAP_PART_KEY_TYPES | XCB_XKB_MAP_PART_KEY_SYMS |
                                       XCB_XKB_MAP_PART_MODIFIER_MAP | XCB_XKB_MAP_PART_EXPLICIT_COMPONENTS |
                                       XCB_XKB_MAP_PART_KEY_ACTIONS | XCB_XKB_MAP_PART_VIRTUAL_MODS |
                                       XCB_XKB_MAP_PART_VIRTUAL_MOD_MAP;
    xcb_xkb_select_events(connection_.get(), static_cast<xcb_xkb_device_spec_t>(device_), events, 0, events, mapParts,
                          mapParts, nullptr);
    readKeyboard();
    openCompose();
}

void KeyObserver::readKeyboard() {
    keymap_.reset(
        xkb_x11_keymap_new_from_device(context_.get(), connection_.get(), device_, XKB_KEYMAP_COMPILE_NO_FLAGS));
    state_.reset(keymap_ ? xkb_x11_state_new_from_device(keymap_.get(), connection_.get(), device_) : nullptr);
}

void KeyObserver::openCompose() {
    for (const std::string& locale : locales()) {
        composeTable_.reset(
            xkb_compose_table_new_from_locale(context_.get(), locale.c_str(), XKB_COMPOSE_COMPILE_NO_FLAGS));
        if (composeTable_)
            break;
    }
    if (composeTable_)
        compose_.reset(xkb_compose_state_new(composeTable_.get(), XKB_COMPOSE_STATE_NO_FLAGS));
}

void KeyObserver::keyboardChanged(const xcb_generic_event_t& event) {
    const auto& any = reinterpret_cast<const xcb_xkb_state_notify_event_t&>(event); // all begin in the same way
    switch (any.xkbType) {
    case XCB_XKB_NEW_KEYBOARD_NOTIFY:
    case XCB_XKB_MAP_NOTIFY: isStale_ = true; break;
    case XCB_XKB_STATE_NOTIFY:
        if (state_)
            xkb_state_update_mask(state_.get(), any.baseMods, any.latchedMods, any.lockedMods,
                                  static_cast<xkb_layout_index_t>(any.baseGroup),
                                  static_cast<xkb_layout_index_t>(any.latchedGroup), any.lockedGroup);
        break;
    default: break;
    }
}

void KeyObserver::refresh() {
    if (isStale_)
        readKeyboard();
    isStale_ = false;
}

xkb_mod_index_t KeyObserver::indexOf(Modifier modifier) const {
    for (const RealModifier& real : s_realModifiers)
        if (real.modifier == modifier)
            return xkb_keymap_mod_get_index(keymap_.get(), real.name);
    return XKB_MOD_INVALID;
}

Modifiers KeyObserver::modifiers() const {
    Modifiers held;
    if (!state_)
        return held;
    for (const RealModifier& real : s_realModifiers)
        if (xkb_state_mod_name_is_active(state_.get(), real.name, XKB_STATE_MODS_EFFECTIVE) > 0)
            held.insert(real.modifier);
    return held;
}

bool KeyObserver::isConsumed(xkb_keycode_t key, xkb_mod_index_t modifier) const {
    return xkb_state_mod_index_is_consumed2(state_.get(), key, modifier, XKB_CONSUMED_MODE_XKB) > 0;
}

/// Returns the modifiers that have no part in the character of a key.
Modifiers KeyObserver::unconsumed(xkb_keycode_t key, Modifiers held, xkb_keysym_t symbol) const {
    Modifiers rest;
    for (const Modifier modifier : s_modifiers)
        if (held.contains(modifier) && !isConsumed(key, indexOf(modifier)))
            rest.insert(modifier);
    // Caps Lock makes capitals of all letters, also where the layout does not say so.
    const xkb_keysym_t* symbols = nullptr;
    const int count = xkb_state_key_get_syms(state_.get(), key, &symbols);
    if (count == 1 && symbols[0] != symbol)
        rest.erase(Modifier::CapsLock);
    return rest;
}

void KeyObserver::pressed(std::uint8_t key, std::uint32_t serverTime, bool isHidden) {
    hidden_[key] = isHidden;
    repeated(key, serverTime);
}

bool KeyObserver::isForManager(std::uint8_t key) {
    refresh();
    if (!state_)
        return false;
    const xkb_keysym_t symbol = xkb_state_key_get_one_sym(state_.get(), key);
    const Modifiers held = modifiers();
    const Modifiers rest = characterOf(symbol) ? unconsumed(key, held, symbol) : held;
    return rest.contains(Modifier::Windows) || (rest.contains(Modifier::Alt) && baseOf(key) == XKB_KEY_Tab);
}

void KeyObserver::repeated(std::uint8_t key, std::uint32_t serverTime) {
    refresh();
    if (hidden_[key] || !state_ || privacy_.mode() == KeyMode::Nothing)
        return;
    const std::optional<Meaning> meaning = meaningOf(key);
    if (meaning && privacy_.takesKey(!meaning->isShortcut) && !privacy_.isDenied())
        input_.addKey(clock_.instantOf(serverTime), meaning->stroke);
}

void KeyObserver::windowChanged() {
    if (compose_)
        xkb_compose_state_reset(compose_.get());
}

std::optional<KeyObserver::Meaning> KeyObserver::meaningOf(xkb_keycode_t key) {
    const xkb_keysym_t symbol = xkb_state_key_get_one_sym(state_.get(), key);
    if (symbol == XKB_KEY_NoSymbol || isModifierKey(symbol))
        return std::nullopt;
    const Modifiers held = modifiers();
    const char32_t character = characterOf(symbol);
    const Modifiers rest = character ? unconsumed(key, held, symbol) : held;
    if (hasCommon(rest, s_chordModifiers))
        return chord(key, symbol, held);
    const bool isFed = compose_ && xkb_compose_state_feed(compose_.get(), symbol) == XKB_COMPOSE_FEED_ACCEPTED;
    const xkb_compose_status status = isFed ? xkb_compose_state_get_status(compose_.get()) : XKB_COMPOSE_NOTHING;
    if (status == XKB_COMPOSE_COMPOSING)
        return std::nullopt;
    if (status == XKB_COMPOSE_COMPOSED) {
        const char32_t composed = characterOf(xkb_compose_state_get_one_sym(compose_.get()));
        xkb_compose_state_reset(compose_.get());
        return composed ? std::optional(Meaning{storedCharacter(composed, rest)}) : std::nullopt;
    }
    if (status == XKB_COMPOSE_CANCELLED) {
        xkb_compose_state_reset(compose_.get());
        if (character)
            return std::nullopt; // neither of the keys types anything
    }
    if (character)
        return Meaning{storedCharacter(character, rest)};
    return keyOf(virtualKeyOf(symbol), held);
}

/// A key without a code is left out: nobody could say which one it was.
std::optional<KeyObserver::Meaning> KeyObserver::keyOf(VirtualKey key, Modifiers held) {
    return key != VirtualKey::Unknown ? std::optional(Meaning{storedKey(key, held), true}) : std::nullopt;
}

/// Returns the symbol of a key without modifiers, or `XKB_KEY_NoSymbol`.
xkb_keysym_t KeyObserver::baseOf(xkb_keycode_t key) const {
    const xkb_layout_index_t group = xkb_state_key_get_layout(state_.get(), key);
    const xkb_keysym_t* symbols = nullptr;
    const int count = xkb_keymap_key_get_syms_by_level(keymap_.get(), key, group, 0, &symbols);
    return count > 0 ? symbols[0] : xkb_keysym_t{XKB_KEY_NoSymbol};
}

/// A key with Ctrl, Alt or Super is known by what it types without them.
std::optional<KeyObserver::Meaning> KeyObserver::chord(xkb_keycode_t key, xkb_keysym_t symbol, Modifiers held) const {
    const xkb_keysym_t own = baseOf(key);
    const xkb_keysym_t base = own != XKB_KEY_NoSymbol ? own : symbol;
    const bool isKeypadDigit = symbol >= XKB_KEY_KP_0 && symbol <= XKB_KEY_KP_9;
    const char32_t character = characterOf(isKeypadDigit ? symbol : base);
    if (const std::uint32_t code = virtualKeyOfCharacter(character))
        return keyOf(static_cast<VirtualKey>(code), held);
    if (character)
        return Meaning{storedCharacter(character, held), true};
    const VirtualKey named = virtualKeyOf(symbol);
    return keyOf(named != VirtualKey::Unknown ? named : virtualKeyOf(base), held);
}

} // namespace Recorder
