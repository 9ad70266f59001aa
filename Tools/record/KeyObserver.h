#pragma once

#include "Tools/record/HeldInput.h"
#include "Tools/record/Releaser.h"
#include "Tools/record/ServerClock.h"
#include "Tools/record/XConnection.h"

#include <xcb/xinput.h>
#include <xkbcommon/xkbcommon-compose.h>
#include <xkbcommon/xkbcommon.h>

#include <bitset>
#include <cstdint>
#include <memory>
#include <optional>

namespace Recorder {

/// Records which keys are pressed, as what they type.
class KeyObserver {
public:
    KeyObserver(XConnection& connection, const ServerClock& clock, HeldInput& input, PrivacyFilter& privacy);

    /// Takes a press. One that is hidden is not recorded, nor are its repetitions.
    void pressed(std::uint8_t key, std::uint32_t serverTime, bool isHidden);

    /// Returns whether a window manager may be what has grabbed a press that comes now: it types nothing anywhere,
    /// since it is a key with Super, or Alt and Tab.
    bool isForManager(std::uint8_t key);

    /// Takes a repetition of a press.
    void repeated(std::uint8_t key, std::uint32_t serverTime);

    /// Takes an event of the keyboard extension.
    void keyboardChanged(const xcb_generic_event_t& event);
    std::uint8_t firstEvent() const { return firstEvent_; }

    /// Reads the keyboard map if it was changed. Called after each batch of events: programs that type change the map
    /// for a few milliseconds.
    void refresh();

    /// Another window has the keys now, so no dead key waits for the next one.
    void windowChanged();

    /// Returns the modifiers that are down now.
    ZULMetaData::Modifiers modifiers() const;

private:
    /// What a key press means.
    struct Meaning {
        ZULMetaData::KeyStroke stroke;
        bool isShortcut = false; ///< recorded though characters are not
    };

    void readKeyboard();
    void openCompose();
    std::optional<Meaning> meaningOf(xkb_keycode_t key);
    xkb_keysym_t baseOf(xkb_keycode_t key) const;
    std::optional<Meaning> chord(xkb_keycode_t key, xkb_keysym_t symbol, ZULMetaData::Modifiers held) const;
    static std::optional<Meaning> keyOf(ZULMetaData::VirtualKey key, ZULMetaData::Modifiers held);
    bool isConsumed(xkb_keycode_t key, xkb_mod_index_t modifier) const;
    ZULMetaData::Modifiers unconsumed(xkb_keycode_t key, ZULMetaData::Modifiers held, xkb_keysym_t symbol) const;
    xkb_mod_index_t indexOf(ZULMetaData::Modifier modifier) const;

    XConnection& connection_;
    const ServerClock& clock_;
    HeldInput& input_;
    PrivacyFilter& privacy_;
    std::uint8_t firstEvent_ = 0;
    std::int32_t device_ = -1;
    std::bitset<256> hidden_; ///< keys whose last press is hidden
    bool isStale_ = false;    ///< the map has changed since it was read
    std::unique_ptr<xkb_context, Releaser<xkb_context_unref>> context_;
    std::unique_ptr<xkb_keymap, Releaser<xkb_keymap_unref>> keymap_;
    std::unique_ptr<xkb_state, Releaser<xkb_state_unref>> state_;
    std::unique_ptr<xkb_compose_table, Releaser<xkb_compose_table_unref>> composeTable_;
    std::unique_ptr<xkb_compose_state, Releaser<xkb_compose_state_unref>> compose_;
};

} // namespace Recorder
