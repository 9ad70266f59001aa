// The application that the tests of the recorder record: a window that shows each click, key and motion at once.
//
// Its picture changes with each click and key: the colour of the field in the middle counts them. A white square of 17
// pixels is drawn where the pointer is. What happens is printed, one line for each event, with its time on the clock of
// the X server; "drawn COUNT TIME" says when the server had drawn a colour. Lines on standard input change the window:
// "title TEXT", "class TEXT", "cursor NUMBER", "move X Y", "resize W H", "blank" (a cursor without pixels), "hide" and
// "show" (the cursor, for all windows), "grab" and "ungrab" (the keyboard), "grabkey CODE"
// (whatever is held with it, as window managers do), "unmap" and "map", "close", "mortal" (each key closes it).

#include <xcb/xcb.h>
#include <xcb/xfixes.h>

#include <poll.h>
#include <unistd.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <iostream>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

namespace {

constexpr std::int16_t s_marker = 17;

/// Colours that lossy compression keeps apart.
constexpr std::array<std::uint32_t, 8> s_colours{0x000000, 0x0000ff, 0x00ff00, 0x00ffff,
                                                 0xff0000, 0xff00ff, 0xffff00, 0x808080};

struct FreeDeleter {
    void operator()(void* memory) const { std::free(memory); }
};

class ShownWindow {
public:
    ShownWindow(std::int16_t x, std::int16_t y, std::uint16_t width, std::uint16_t height, bool isManaged)
        : width_(width), height_(height) {
        connection_ = xcb_connect(nullptr, nullptr);
        if (xcb_connection_has_error(connection_) != 0) {
            std::fprintf(stderr, "ShownWindow: the display cannot be opened\n");
            std::exit(1);
        }
        screen_ = xcb_setup_roots_iterator(xcb_get_setup(connection_)).data;
        window_ = xcb_generate_id(connection_);
        const std::array<std::uint32_t, 3> values{0x404040, isManaged ? 0U : 1U,
                                                  XCB_EVENT_MASK_EXPOSURE | XCB_EVENT_MASK_BUTTON_PRESS |
                                                      XCB_EVENT_MASK_KEY_PRESS | XCB_EVENT_MASK_POINTER_MOTION |
                                                      XCB_EVENT_MASK_ENTER_WINDOW | XCB_EVENT_MASK_STRUCTURE_NOTIFY};
        xcb_create_window(connection_, XCB_COPY_FROM_PARENT, window_, screen_->root, x, y, width, height, 0,
                          XCB_WINDOW_CLASS_INPUT_OUTPUT, screen_->root_visual,
                          XCB_CW_BACK_PIXEL | XCB_CW_OVERRIDE_REDIRECT | XCB_CW_EVENT_MASK, values.data());
        const auto fixes = xcb_xfixes_query_version(connection_, 4, 0);
        std::free(xcb_xfixes_query_version_reply(connection_, fixes, nullptr));
        setTitle("Shown Window");
        setClass("ShownWindow");
        std::array<std::uint32_t, 18> sizes{};
        sizes[0] = 1 | 2;
        sizes[1] = static_cast<std::uint32_t>(x);
        sizes[2] = static_cast<std::uint32_t>(y);
        sizes[3] = width;
        sizes[4] = height;
        xcb_change_property(connection_, XCB_PROP_MODE_REPLACE, window_, XCB_ATOM_WM_NORMAL_HINTS,
                            XCB_ATOM_WM_SIZE_HINTS, 32, sizes.size(), sizes.data());
        context_ = xcb_generate_id(connection_);
        xcb_create_gc(connection_, context_, window_, 0, nullptr);
        xcb_map_window(connection_, window_);
        xcb_flush(connection_);
    }

    void run() {
        std::printf("window %u\n", window_);
        std::fflush(stdout);
        std::array<pollfd, 2> waits{pollfd{xcb_get_file_descriptor(connection_), POLLIN, 0},
                                    pollfd{STDIN_FILENO, POLLIN, 0}};
        while (!isOver_ && xcb_connection_has_error(connection_) == 0) {
            while (const std::unique_ptr<xcb_generic_event_t, FreeDeleter> event{xcb_poll_for_event(connection_)})
                take(*event);
            draw();
            std::fflush(stdout);
            poll(waits.data(), waits.size(), 1000);
            if ((waits[1].revents & (POLLIN | POLLHUP)) == 0)
                continue;
            do { // several lines may have come at once
                readLine();
            } while (!isOver_ && std::cin.rdbuf()->in_avail() > 0);
        }
    }

private:
    template <class Event>
    static const Event& as(const xcb_generic_event_t& event) {
        return reinterpret_cast<const Event&>(event);
    }

    void take(const xcb_generic_event_t& event) {
        switch (event.response_type & 0x7f) {
        case XCB_BUTTON_PRESS: {
            const auto& press = as<xcb_button_press_event_t>(event);
            if (press.detail <= 3)
                count("button", press.detail, press.time);
            break;
        }
        case XCB_KEY_PRESS: {
            const auto& press = as<xcb_key_press_event_t>(event);
            count("key", press.detail, press.time);
            isOver_ = isMortal_;
            break;
        }
        case XCB_MOTION_NOTIFY: {
            const auto& motion = as<xcb_motion_notify_event_t>(event);
            moveMarker(motion.event_x, motion.event_y);
            std::printf("motion %d %d %u\n", motion.root_x, motion.root_y, motion.time);
            break;
        }
        case XCB_CONFIGURE_NOTIFY: {
            const auto& size = as<xcb_configure_notify_event_t>(event);
            width_ = size.width;
            height_ = size.height;
            break;
        }
        case XCB_EXPOSE: isStale_ = true; break;
        default: break;
        }
    }

    void count(const char* what, unsigned detail, std::uint32_t time) {
        ++count_;
        isStale_ = true;
        std::printf("%s %u %u\n", what, detail, time);
    }

    void moveMarker(std::int16_t x, std::int16_t y) {
        nextX_ = x;
        nextY_ = y;
        isMoved_ = true;
    }

    void fill(std::uint32_t colour, const xcb_rectangle_t& area) {
        xcb_change_gc(connection_, context_, XCB_GC_FOREGROUND, &colour);
        xcb_poly_fill_rectangle(connection_, window_, context_, 1, &area);
    }

    static xcb_rectangle_t markerAt(std::int16_t x, std::int16_t y) {
        return {static_cast<std::int16_t>(x - s_marker / 2), static_cast<std::int16_t>(y - s_marker / 2), s_marker,
                s_marker};
    }

    /// The field that counts is a strip on top of the window; the pointer stays below it.
    void draw() {
        constexpr std::uint16_t stripHeight = 64;
        if (isStale_)
            fill(s_colours[count_ % s_colours.size()], {0, 0, width_, stripHeight});
        if (isMoved_) {
            fill(0x404040, markerAt(x_, y_));
            x_ = nextX_;
            y_ = nextY_;
            fill(0xffffff, markerAt(x_, y_));
        }
        if (isStale_)
            tellDrawn();
        else if (isMoved_)
            xcb_flush(connection_);
        isStale_ = isMoved_ = false;
    }

    /// Waits until the server has drawn, whose clock this machine's is too.
    void tellDrawn() {
        const auto cookie = xcb_get_input_focus(connection_);
        const std::unique_ptr<xcb_get_input_focus_reply_t, FreeDeleter> reply(
            xcb_get_input_focus_reply(connection_, cookie, nullptr));
        timespec time{};
        clock_gettime(CLOCK_MONOTONIC, &time);
        std::printf("drawn %zu %lld.%06ld\n", count_, time.tv_sec * 1000LL + time.tv_nsec / 1'000'000,
                    time.tv_nsec % 1'000'000);
    }

    void setTitle(const std::string& title) {
        const char* name = "_NET_WM_NAME";
        const char* type = "UTF8_STRING";
        xcb_change_property(connection_, XCB_PROP_MODE_REPLACE, window_, atom(name), atom(type), 8,
                            static_cast<std::uint32_t>(title.size()), title.data());
    }

    void setClass(const std::string& name) {
        const std::string both = std::string("instance") + '\0' + name + '\0';
        xcb_change_property(connection_, XCB_PROP_MODE_REPLACE, window_, XCB_ATOM_WM_CLASS, XCB_ATOM_STRING, 8,
                            static_cast<std::uint32_t>(both.size()), both.data());
    }

    xcb_atom_t atom(const char* name) {
        const auto cookie = xcb_intern_atom(connection_, 0, static_cast<std::uint16_t>(std::strlen(name)), name);
        const std::unique_ptr<xcb_intern_atom_reply_t, FreeDeleter> reply(
            xcb_intern_atom_reply(connection_, cookie, nullptr));
        return reply ? reply->atom : xcb_atom_t{XCB_ATOM_NONE};
    }

    /// A cursor of the server's font, or one without pixels.
    void setCursor(std::uint16_t glyph, bool isBlank) {
        const xcb_cursor_t cursor = xcb_generate_id(connection_);
        if (isBlank) {
            const xcb_pixmap_t pixmap = xcb_generate_id(connection_);
            xcb_create_pixmap(connection_, 1, pixmap, window_, 8, 8);
            const xcb_gcontext_t context = xcb_generate_id(connection_);
            const std::uint32_t nothing = 0;
            xcb_create_gc(connection_, context, pixmap, XCB_GC_FOREGROUND, &nothing);
            const xcb_rectangle_t all{0, 0, 8, 8};
            xcb_poly_fill_rectangle(connection_, pixmap, context, 1, &all);
            xcb_create_cursor(connection_, cursor, pixmap, pixmap, 0, 0, 0, 0, 0, 0, 3, 4);
        } else {
            const xcb_font_t font = xcb_generate_id(connection_);
            xcb_open_font(connection_, font, 6, "cursor");
            xcb_create_glyph_cursor(connection_, cursor, font, font, glyph, static_cast<std::uint16_t>(glyph + 1), 0, 0,
                                    0, 0xffff, 0xffff, 0xffff);
        }
        xcb_change_window_attributes(connection_, window_, XCB_CW_CURSOR, &cursor);
    }

    /// Takes all keys, as a prompt for a password does.
    void grabKeyboard() {
        const auto cookie =
            xcb_grab_keyboard(connection_, 0, window_, XCB_CURRENT_TIME, XCB_GRAB_MODE_ASYNC, XCB_GRAB_MODE_ASYNC);
        const std::unique_ptr<xcb_grab_keyboard_reply_t, FreeDeleter> reply(
            xcb_grab_keyboard_reply(connection_, cookie, nullptr));
        std::printf("grabbed %d\n", reply ? reply->status : -1);
    }

    /// Waits until the server has done what it was asked for.
    void tellDone(const char* what) {
        const auto cookie = xcb_get_input_focus(connection_);
        std::free(xcb_get_input_focus_reply(connection_, cookie, nullptr));
        std::printf("%s\n", what);
    }

    void ungrabKeyboard() {
        xcb_ungrab_keyboard(connection_, XCB_CURRENT_TIME);
        tellDone("ungrabbed");
    }

    /// From the press of that key until its release, the server sends all keys to this client.
    void grabKey(std::uint32_t code) {
        xcb_grab_key(connection_, 0, screen_->root, XCB_MOD_MASK_ANY, static_cast<xcb_keycode_t>(code),
                     XCB_GRAB_MODE_ASYNC, XCB_GRAB_MODE_ASYNC);
        tellDone("grabbed");
    }

    void readLine() {
        std::string line;
        if (!std::getline(std::cin, line)) {
            isOver_ = true;
            return;
        }
        std::istringstream words(line);
        std::string what;
        words >> what >> std::ws;
        std::string rest;
        std::getline(words, rest);
        std::istringstream numbers(rest);
        std::array<std::uint32_t, 2> two{};
        numbers >> two[0] >> two[1];
        if (what == "title")
            setTitle(rest);
        else if (what == "class")
            setClass(rest);
        else if (what == "cursor")
            setCursor(static_cast<std::uint16_t>(two[0]), false);
        else if (what == "blank")
            setCursor(0, true);
        else if (what == "hide")
            xcb_xfixes_hide_cursor(connection_, window_);
        else if (what == "show")
            xcb_xfixes_show_cursor(connection_, window_);
        else if (what == "grab")
            grabKeyboard();
        else if (what == "ungrab")
            ungrabKeyboard();
        else if (what == "grabkey")
            grabKey(two[0]);
        else if (what == "mortal")
            isMortal_ = true;
        else if (what == "unmap")
            xcb_unmap_window(connection_, window_);
        else if (what == "map")
            xcb_map_window(connection_, window_);
        else if (what == "move")
            xcb_configure_window(connection_, window_, XCB_CONFIG_WINDOW_X | XCB_CONFIG_WINDOW_Y, two.data());
        else if (what == "resize")
            xcb_configure_window(connection_, window_, XCB_CONFIG_WINDOW_WIDTH | XCB_CONFIG_WINDOW_HEIGHT, two.data());
        else if (what == "close")
            isOver_ = true;
        xcb_flush(connection_);
    }

    xcb_connection_t* connection_;
    xcb_screen_t* screen_ = nullptr;
    xcb_window_t window_ = XCB_NONE;
    xcb_gcontext_t context_ = XCB_NONE;
    std::uint16_t width_;
    std::uint16_t height_;
    std::int16_t x_ = -100;
    std::int16_t y_ = -100;
    std::int16_t nextX_ = 0;
    std::int16_t nextY_ = 0;
    std::size_t count_ = 0;
    bool isStale_ = true;
    bool isMoved_ = false;
    bool isMortal_ = false;
    bool isOver_ = false;
};

} // namespace

/// ShownWindow X Y WIDTH HEIGHT [unmanaged]
int main(int argc, char** argv) {
    std::ios::sync_with_stdio(false); // so that it knows of lines that it has read ahead
    constexpr int geometry = 5;
    if (argc < geometry)
        return 2;
    const auto number = [argv](int index) { return std::atoi(argv[index]); };
    ShownWindow window(static_cast<std::int16_t>(number(1)), static_cast<std::int16_t>(number(2)),
                       static_cast<std::uint16_t>(number(3)), static_cast<std::uint16_t>(number(4)), argc == geometry);
    window.run();
    return 0;
}
