#pragma once

// A connection to the X server.

#include "Tools/record/Geometry.h"

#include <xcb/xcb.h>

#include <cstdint>
#include <cstdlib>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace Recorder {

struct FreeDeleter {
    void operator()(void* memory) const { std::free(memory); }
};

/// A reply or an event of the server, which xcb allocates.
template <class T>
using Reply = std::unique_ptr<T, FreeDeleter>;

inline constexpr std::uint8_t s_eventTypeBits = 0x7f; ///< the other bit says that a client has sent the event

class XConnection {
public:
    /// An empty `display` stands for $DISPLAY. Throws `Refusal` if the server cannot be reached.
    explicit XConnection(const std::string& display);
    ~XConnection() { xcb_disconnect(connection_); }
    XConnection(const XConnection&) = delete;
    XConnection& operator=(const XConnection&) = delete;

    xcb_connection_t* get() const { return connection_; }
    const xcb_screen_t& screen() const { return *screen_; }
    xcb_window_t root() const { return screen_->root; }
    int descriptor() const { return xcb_get_file_descriptor(connection_); }
    bool isAlive() const { return xcb_connection_has_error(connection_) == 0; }
    void flush() const { xcb_flush(connection_); }

    /// Returns the present size of the screen.
    Area rootArea() const;

    /// Returns where a window is, border included, or nothing if it is gone.
    std::optional<Area> areaOf(xcb_window_t window) const;

    /// Returns the number of a name, which the server is asked for once.
    xcb_atom_t atom(const std::string& name) const;

    /// Returns whether the server has an extension.
    bool has(xcb_extension_t& extension) const;

    /// Return the value of a property; empty if there is none. Texts are valid UTF-8.
    ///@{
    std::vector<std::uint32_t> numbers(xcb_window_t window, xcb_atom_t property) const;
    std::optional<std::string> text(xcb_window_t window, xcb_atom_t property) const;
    ///@}

    /// Returns the parent and the children of a window; null if it is gone.
    Reply<xcb_query_tree_reply_t> treeOf(xcb_window_t window) const;

    /// Returns where the pointer is; null if the server is gone.
    Reply<xcb_query_pointer_reply_t> pointer() const;

    /// Returns the child of the root window that holds `window`, which may be the window itself.
    xcb_window_t topLevelOf(xcb_window_t window) const;

private:
    xcb_connection_t* connection_;
    xcb_screen_t* screen_ = nullptr;
    mutable std::vector<std::pair<std::string, xcb_atom_t>> atoms_;
};

} // namespace Recorder
