#include "Tools/render/KeyCaps.h"

#include <map>
#include <string_view>

namespace Render {

namespace {

/// What is written on keys whose names are for programs. All others begin with a capital letter. The page has the same.
const std::map<std::string_view, const char*> s_engraved{{"returnKey", "Return"},
                                                         {"back", "Backspace"},
                                                         {"capital", "Caps Lock"},
                                                         {"escape", "Esc"},
                                                         {"prior", "Page Up"},
                                                         {"next", "Page Down"},
                                                         {"left", "←"},
                                                         {"up", "↑"},
                                                         {"right", "→"},
                                                         {"down", "↓"},
                                                         {"snapshot", "Print Screen"},
                                                         {"function", "Fn"},
                                                         {"numlock", "Num Lock"},
                                                         {"scroll", "Scroll Lock"},
                                                         {"plus", "+"},
                                                         {"comma", ","},
                                                         {"minus", "-"},
                                                         {"period", "."},
                                                         {"closeParenthesis", ")"},
                                                         {"openParenthesis", "("},
                                                         {"exclamation", "!"},
                                                         {"atSymbol", "@"},
                                                         {"pound", "#"},
                                                         {"percent", "%"},
                                                         {"carat", "^"},
                                                         {"ampersand", "&"},
                                                         {"star", "*"},
                                                         {"unknown", "unknown key"}};

} // namespace

std::string keyCap(const std::string& label) {
    const std::size_t begin = label.find('[');
    if (begin == std::string::npos || label.size() < begin + 3 || label.back() != ']')
        return label;
    std::string name = label.substr(begin + 1, label.size() - begin - 2);
    if (const auto found = s_engraved.find(name); found != s_engraved.end())
        name = found->second;
    else if (name.front() >= 'a' && name.front() <= 'z')
        name.front() = static_cast<char>(name.front() - 'a' + 'A');
    return label.substr(0, begin) + name;
}

std::vector<CaptionPart> partsAt(const ZULMetaData::KeyCaption& caption, double time, bool showsTyped) {
    std::vector<CaptionPart> parts;
    for (const ZULMetaData::CaptionKey& key : caption.keys) {
        if (key.time > time || (key.isTyped && !showsTyped))
            continue;
        if (key.isTyped && !parts.empty() && parts.back().isTyped)
            parts.back().text += key.label;
        else
            parts.push_back({key.isTyped ? key.label : keyCap(key.label), key.isTyped});
    }
    return parts;
}

} // namespace Render
