#include "ZULMetaDataBridge/Source/KeyCaptions.h"

#include "SharedDependencies/UTF8.h"
#include "ZULMetaDataBridge/Source/HumanReadableActions.h"
#include "ZULMetaDataBridge/Source/KeyNames.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr double s_hold = 1.5; ///< seconds that a caption stays after its last key
constexpr std::size_t s_lineLength = 42;

constexpr auto s_mask = "\xe2\x80\xa2"; // bullet

/// The library's names of the modifiers and their signs, in the order in which they are written before a key.
constexpr std::array<std::pair<std::string_view, std::string_view>, 5> s_modifierSigns{{{"<Ctrl>", "\xe2\x8c\x83"},
                                                                                        {"<Alt>", "\xe2\x8c\xa5"},
                                                                                        {"<Win>", "\xe2\x8a\x9e"},
                                                                                        {"<Shift>", "\xe2\x87\xa7"},
                                                                                        {"<Cmd>", "\xe2\x8c\x98"}}};

/// The modifiers of a key.
class Modifiers {
public:
    explicit Modifiers(std::uint32_t flags)
        : names_(HumanReadableActions::KeyboardModifiersToString(static_cast<std::int32_t>(flags))) {}

    bool has(std::string_view name) const { return names_.find(name) != std::string::npos; }
    bool makeShortcut() const { return has("<Ctrl>") || has("<Alt>") || has("<Win>") || has("<Cmd>"); }
    bool makeUpperCase() const { return has("<Shift>") != has("<Alpha>"); }

    std::string signs() const {
        std::string text;
        for (const auto& [name, sign] : s_modifierSigns)
            if (has(name))
                text += sign;
        return text;
    }

private:
    std::string names_;
};

constexpr std::uint32_t s_space = 32;
constexpr std::string_view s_shiftedDigits = ")!@#$%^&*(";
constexpr std::uint32_t s_firstPunctuation = 187;
constexpr std::string_view s_punctuation = "+,-.";

/// Returns what a virtual key with a name types; empty if it types nothing.
std::string typedByVirtualKey(std::uint32_t code, const Modifiers& modifiers) {
    if (code == s_space)
        return " ";
    if (code >= '0' && code <= '9')
        return std::string(1, modifiers.has("<Shift>") ? s_shiftedDigits[code - '0'] : static_cast<char>(code));
    if (code >= s_firstPunctuation && code - s_firstPunctuation < s_punctuation.size())
        return std::string(1, s_punctuation[code - s_firstPunctuation]);
    if (code < 'A' || code > 'Z')
        return {};
    const bool isUpperCase = modifiers.makeUpperCase() || modifiers.makeShortcut();
    return std::string(1, static_cast<char>(isUpperCase ? code : code - 'A' + 'a'));
}

/// Returns what a key types; empty for a special key. A number may stand for any character.
std::string typedBy(const KeyStroke& key, const KeyName& name, const Modifiers& modifiers) {
    switch (name.meaning) {
    case KeyMeaning::Character: return name.text;
    case KeyMeaning::Number: return "[" + name.text + "]";
    case KeyMeaning::Key: break;
    }
    return isVirtualKey(key) ? typedByVirtualKey(key.characterCode, modifiers) : std::string();
}

CaptionKey captionKey(const KeyEvent& event, bool showsKeys) {
    const Modifiers modifiers(event.key.eventFlagsCode);
    const KeyName name = keyNameOf(event.key);
    const std::string typed = typedBy(event.key, name, modifiers);
    if (typed.empty())
        return {event.time, modifiers.signs() + "[" + name.text + "]", false};
    const std::string shown = showsKeys ? typed : s_mask;
    if (modifiers.makeShortcut())
        return {event.time, modifiers.signs() + shown, false};
    return {event.time, shown, true};
}

bool endsLine(const KeyStroke& key) {
    return keyNameOf(key).text == "returnKey";
}

/// Returns the number of characters in a UTF-8 text.
std::size_t lengthOf(const std::string& text) {
    return static_cast<std::size_t>(
        std::count_if(text.begin(), text.end(), [](char c) { return !continuesCharacter(c); }));
}

} // namespace

std::vector<KeyCaption> keyCaptions(std::vector<KeyEvent> keys, bool showsKeys, double pause) {
    std::erase_if(keys, [](const KeyEvent& event) { return !std::isfinite(event.time); });
    std::stable_sort(keys.begin(), keys.end(),
                     [](const KeyEvent& left, const KeyEvent& right) { return left.time < right.time; });
    std::vector<KeyCaption> captions;
    bool isLineEnded = true;
    for (const KeyEvent& event : keys) {
        CaptionKey key = captionKey(event, showsKeys);
        const bool isNew = isLineEnded || event.time - captions.back().keys.back().time >= pause ||
                           lengthOf(captions.back().text) + lengthOf(key.label) > s_lineLength;
        if (isNew)
            captions.push_back({event.time, 0, {}, {}});
        KeyCaption& caption = captions.back();
        if (!isNew && !(key.isTyped && caption.keys.back().isTyped))
            caption.text += ' ';
        caption.text += key.label;
        caption.end = event.time + s_hold;
        caption.keys.push_back(std::move(key));
        isLineEnded = endsLine(event.key);
    }
    return captions;
}

} // namespace ZULMetaData
