#include "ZULMetaDataSession/Insights/KeyCaptions.h"

#include "SharedDependencies/UTF8.h"
#include "ZULMetaDataBridge/Source/KeyNames.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <string_view>
#include <utility>

namespace ZULMetaData {

namespace {

constexpr auto s_mask = "\xe2\x80\xa2"; // bullet

/// The signs of the modifiers, in the order in which they are written before a key.
constexpr std::array<std::pair<Modifier, std::string_view>, 5> s_modifierSigns{{{Modifier::Control, "\xe2\x8c\x83"},
                                                                                {Modifier::Alt, "\xe2\x8c\xa5"},
                                                                                {Modifier::Windows, "\xe2\x8a\x9e"},
                                                                                {Modifier::Shift, "\xe2\x87\xa7"},
                                                                                {Modifier::Command, "\xe2\x8c\x98"}}};

bool makeShortcut(Modifiers modifiers) {
    modifiers.erase(Modifier::Shift);
    modifiers.erase(Modifier::CapsLock);
    return !modifiers.empty();
}

/// Returns whether modifiers keep a key from typing a character. Alt types the third sign of a key on many keyboards,
/// and so does Control with Alt.
bool keepFromTyping(Modifiers modifiers) {
    const bool hasCommand = modifiers.contains(Modifier::Command) || modifiers.contains(Modifier::Windows);
    return hasCommand || (modifiers.contains(Modifier::Control) && !modifiers.contains(Modifier::Alt));
}

bool makeUpperCase(Modifiers modifiers) {
    return modifiers.contains(Modifier::Shift) != modifiers.contains(Modifier::CapsLock);
}

std::string signsOf(Modifiers modifiers) {
    std::string text;
    for (const auto& [modifier, sign] : s_modifierSigns)
        if (modifiers.contains(modifier))
            text += sign;
    return text;
}

constexpr std::string_view s_shiftedDigits = ")!@#$%^&*(";

/// What the keys from `VirtualKey::Plus` to `VirtualKey::Period` type.
constexpr std::string_view s_punctuation = "+,-.";

/// Returns what a virtual key with a name types; empty if it types nothing.
std::string typedByVirtualKey(const KeyInput& key) {
    constexpr auto firstPunctuation = static_cast<std::uint32_t>(VirtualKey::Plus);
    const std::uint32_t code = key.code;
    if (key.is(VirtualKey::Space))
        return " ";
    if (code >= '0' && code <= '9')
        return std::string(1, key.modifiers.contains(Modifier::Shift) ? s_shiftedDigits[code - '0']
                                                                      : static_cast<char>(code));
    if (code >= firstPunctuation && code - firstPunctuation < s_punctuation.size())
        return std::string(1, s_punctuation[code - firstPunctuation]);
    if (code < 'A' || code > 'Z')
        return {};
    const bool isUpperCase = makeUpperCase(key.modifiers) || makeShortcut(key.modifiers);
    return std::string(1, static_cast<char>(isUpperCase ? code : code - 'A' + 'a'));
}

/// Returns what a key types; empty for a special key. A number may stand for any character.
std::string typedBy(const KeyInput& key, const KeyName& name) {
    switch (name.meaning) {
    case KeyMeaning::Character: return name.text;
    case KeyMeaning::Number: return "[" + name.text + "]";
    case KeyMeaning::Key: break;
    }
    return key.isVirtualKey ? typedByVirtualKey(key) : std::string();
}

KeyName captionNameOf(const KeyInput& key) {
    return keyNameOf({key.code, key.isVirtualKey ? s_virtualKeyFlag : 0});
}

CaptionKey captionKey(double time, const KeyInput& key, const KeyName& name, const KeyCaptionOptions& options) {
    const std::string typed = typedBy(key, name);
    if (typed.empty())
        return {time, signsOf(key.modifiers) + "[" + name.text + "]", false};
    const bool isShown = options.showsKeys || (options.showsShortcuts && keepFromTyping(key.modifiers));
    const std::string shown = isShown ? typed : s_mask;
    if (makeShortcut(key.modifiers))
        return {time, signsOf(key.modifiers) + shown, false};
    return {time, shown, true};
}

bool endsLine(const KeyName& name) {
    return name.text == nameOfVirtualKey(static_cast<std::uint32_t>(VirtualKey::Return));
}

/// Returns the number of characters in a UTF-8 text.
std::size_t lengthOf(const std::string& text) {
    return static_cast<std::size_t>(
        std::count_if(text.begin(), text.end(), [](char c) { return !continuesCharacter(c); }));
}

} // namespace

std::vector<KeyCaption> keyCaptions(const Track<KeyboardActionKind>& keys, const KeyCaptionOptions& options,
                                    double duration) {
    std::vector<KeyCaption> captions;
    bool isLineEnded = true;
    std::size_t length = 0; // of the last caption, in characters
    for (std::size_t i = 0; i < keys.size(); ++i) {
        const double time = keys.times()[i];
        const KeyName name = captionNameOf(keys.values()[i]);
        CaptionKey key = captionKey(time, keys.values()[i], name, options);
        const bool isSeparate = !captions.empty() && !(key.isTyped && captions.back().keys.back().isTyped);
        const std::size_t added = lengthOf(key.label) + (isSeparate ? 1 : 0);
        const bool isNew = isLineEnded || time - captions.back().keys.back().time >= options.pause ||
                           length + added > options.lineLength;
        if (isNew)
            captions.push_back({time, 0, {}, {}});
        KeyCaption& caption = captions.back();
        if (!isNew && isSeparate)
            caption.text += ' ';
        caption.text += key.label;
        length = isNew ? lengthOf(key.label) : length + added;
        caption.end = duration > time ? std::min(time + options.hold, duration) : time + options.hold;
        caption.keys.push_back(std::move(key));
        isLineEnded = endsLine(name);
    }
    return captions;
}

bool typesCharacter(const KeyInput& key) {
    return !makeShortcut(key.modifiers) && !typedBy(key, captionNameOf(key)).empty();
}

} // namespace ZULMetaData
