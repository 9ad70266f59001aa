#include "Tools/record/XConnection.h"

#include "Tools/record/Failure.h"
#include "ZULMetaDataBridge/Source/EntryTexts.h"

#include <fmt/core.h>

#include <cstdlib>
#include <string_view>

namespace Recorder {

namespace {

/// Returns the bytes of a property as UTF-8. Programs may write anything, so U+FFFD stands for each byte that belongs
/// to no character.
std::string utf8Of(std::string_view bytes, xcb_atom_t type) {
    if (type == XCB_ATOM_STRING)
        return ZULMetaData::utf8FromLatin1(bytes);
    std::string text;
    while (!bytes.empty()) {
        const std::size_t valid = ZULMetaData::validUTF8Length(bytes);
        text += bytes.substr(0, valid);
        bytes.remove_prefix(valid);
        if (!bytes.empty()) {
            text += "\xef\xbf\xbd";
            bytes.remove_prefix(1);
        }
    }
    return text;
}

} // namespace

XConnection::XConnection(const std::string& display) {
    int number = 0;
    connection_ = xcb_connect(display.empty() ? nullptr : display.c_str(), &number);
    xcb_screen_iterator_t screens{};
    if (isAlive())
        for (screens = xcb_setup_roots_iterator(xcb_get_setup(connection_)); screens.rem > 1 && number > 0; --number)
            xcb_screen_next(&screens);
    if (!isAlive() || screens.rem == 0) {
        xcb_disconnect(connection_);
        const char* variable = std::getenv("DISPLAY");
        const std::string name = !display.empty() ? display : variable ? variable : "";
        throw Refusal(name.empty() ? "no X display is named: set DISPLAY, or give --display"
                                   : fmt::format("the X display {} cannot be opened: start it, or give another one "
                                                 "with --display",
                                                 name));
    }
    screen_ = screens.data;
}

Area XConnection::rootArea() const {
    return areaOf(root()).value_or(Area{0, 0, screen_->width_in_pixels, screen_->height_in_pixels});
}

std::optional<Area> XConnection::areaOf(xcb_window_t window) const {
    const auto geometryCookie = xcb_get_geometry(connection_, window);
    const auto originCookie = xcb_translate_coordinates(connection_, window, root(), 0, 0);
    const Reply<xcb_get_geometry_reply_t> geometry(xcb_get_geometry_reply(connection_, geometryCookie, nullptr));
    const Reply<xcb_translate_coordinates_reply_t> origin(
        xcb_translate_coordinates_reply(connection_, originCookie, nullptr));
    if (!geometry || !origin)
        return std::nullopt;
    const std::int32_t border = geometry->border_width;
    return Area{origin->dst_x - border, origin->dst_y - border, geometry->width + 2 * border,
                geometry->height + 2 * border};
}

xcb_atom_t XConnection::atom(const std::string& name) const {
    for (const auto& [known, atom] : atoms_)
        if (known == name)
            return atom;
    const auto cookie = xcb_intern_atom(connection_, 0, static_cast<std::uint16_t>(name.size()), name.c_str());
    const Reply<xcb_intern_atom_reply_t> reply(xcb_intern_atom_reply(connection_, cookie, nullptr));
    const xcb_atom_t atom = reply ? reply->atom : xcb_atom_t{XCB_ATOM_NONE};
    atoms_.emplace_back(name, atom);
    return atom;
}

bool XConnection::has(xcb_extension_t& extension) const {
    const xcb_query_extension_reply_t* reply = xcb_get_extension_data(connection_, &extension);
    return reply && reply->present;
}

std::vector<std::uint32_t> XConnection::numbers(xcb_window_t window, xcb_atom_t property) const {
    const auto cookie = xcb_get_property(connection_, 0, window, property, XCB_GET_PROPERTY_TYPE_ANY, 0, 1024);
    const Reply<xcb_get_property_reply_t> reply(xcb_get_property_reply(connection_, cookie, nullptr));
    if (!reply || reply->format != 32)
        return {};
    const auto* values = static_cast<const std::uint32_t*>(xcb_get_property_value(reply.get()));
    return {values, values + xcb_get_property_value_length(reply.get()) / 4};
}

std::optional<std::string> XConnection::text(xcb_window_t window, xcb_atom_t property) const {
    const auto cookie = xcb_get_property(connection_, 0, window, property, XCB_GET_PROPERTY_TYPE_ANY, 0, 16384);
    const Reply<xcb_get_property_reply_t> reply(xcb_get_property_reply(connection_, cookie, nullptr));
    if (!reply || reply->format != 8)
        return std::nullopt;
    const auto* bytes = static_cast<const char*>(xcb_get_property_value(reply.get()));
    return utf8Of({bytes, static_cast<std::size_t>(xcb_get_property_value_length(reply.get()))}, reply->type);
}

Reply<xcb_query_tree_reply_t> XConnection::treeOf(xcb_window_t window) const {
    return Reply<xcb_query_tree_reply_t>(
        xcb_query_tree_reply(connection_, xcb_query_tree(connection_, window), nullptr));
}

Reply<xcb_query_pointer_reply_t> XConnection::pointer() const {
    return Reply<xcb_query_pointer_reply_t>(
        xcb_query_pointer_reply(connection_, xcb_query_pointer(connection_, root()), nullptr));
}

xcb_window_t XConnection::topLevelOf(xcb_window_t window) const {
    for (;;) {
        const auto tree = treeOf(window);
        if (!tree)
            return XCB_WINDOW_NONE;
        if (tree->parent == root() || tree->parent == XCB_WINDOW_NONE)
            return window;
        window = tree->parent;
    }
}

} // namespace Recorder
