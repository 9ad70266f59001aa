// The side of the child: the only source that knows the accessibility bus.

#include "Tools/record/AccessibilityProcess.h"
#include "Tools/record/XConnection.h"

#include <atspi/atspi.h>
#include <glib-unix.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <memory>
#include <optional>
#include <sstream>

namespace Recorder {

namespace {

constexpr int s_callTimeout = 400;   ///< milliseconds of one call
constexpr int s_deepest = 64;        ///< objects that are in each other, from the outermost
constexpr int s_farthest = 256;      ///< objects around a field
constexpr int s_visitedAtMost = 600; ///< objects, in search of the focus

struct ObjectDeleter {
    void operator()(void* object) const { g_object_unref(object); }
};
template <class T>
using Object = std::unique_ptr<T, ObjectDeleter>;

class Watcher {
public:
    /// Returns false if there is no bus.
    bool reach();
    void run();
    void focused(AtspiAccessible* accessible);

private:
    static gboolean inputArrived(gint descriptor, GIOCondition condition, gpointer self);
    void obey(const std::string& line);
    void say(const std::string& line);
    void answerHover(int x, int y);
    static Object<AtspiAccessible> innermostAt(AtspiAccessible* outer, int x, int y);
    Object<AtspiAccessible> applicationOf(std::uint32_t process);
    Object<AtspiAccessible> activeWindowOf(AtspiAccessible* application);
    Object<AtspiAccessible> focusIn(AtspiAccessible* accessible, int& visits);
    bool hasState(AtspiAccessible* accessible, AtspiStateType state);
    bool stillHasFocus();
    void searchFocus();
    const char* currentFocus();

    std::string pending_;
    std::uint32_t process_ = 0;     ///< of the window on top
    Object<AtspiAccessible> focus_; ///< the last one that an event or a search has found
    std::uint32_t focusProcess_ = 0;
    bool isLate_ = false; ///< an answer that a search needs was missing
};

/// Returns nothing if the application does not answer in time, or no longer has the object.
std::optional<bool> stateOf(AtspiAccessible* accessible, AtspiStateType state) {
    const Object<AtspiStateSet> states(atspi_accessible_get_state_set(accessible));
    return states ? std::optional(atspi_state_set_contains(states.get(), state) != FALSE) : std::nullopt;
}

std::uint32_t processOf(AtspiAccessible* accessible) {
    return atspi_accessible_get_process_id(accessible, nullptr);
}

/// Said of an application that does not answer in time: keys wait for the next answer.
constexpr const char* s_late = "late";

const char* kindOf(AtspiAccessible* accessible) {
    GError* error = nullptr;
    atspi_accessible_clear_cache(accessible);
    const AtspiRole role = atspi_accessible_get_role(accessible, &error);
    if (error) {
        g_error_free(error);
        return s_late;
    }
    return role == ATSPI_ROLE_PASSWORD_TEXT ? "password" : "ordinary";
}

/// Whether an object is in the window that the keys of its application go to.
bool isInActiveWindow(AtspiAccessible* accessible) {
    Object<AtspiAccessible> object(static_cast<AtspiAccessible*>(g_object_ref(accessible)));
    for (int depth = 0; object && depth < s_farthest; ++depth) {
        if (stateOf(object.get(), ATSPI_STATE_ACTIVE).value_or(false))
            return true;
        object.reset(atspi_accessible_get_parent(object.get(), nullptr));
    }
    return false;
}

void focusChanged(AtspiEvent* event, void* watcher) {
    if (event->detail1 != 0 && event->source)
        static_cast<Watcher*>(watcher)->focused(event->source);
    g_boxed_free(ATSPI_TYPE_EVENT, event);
}

/// Whether a bus may be looked for: libraries would start one otherwise.
bool hasBusAddress() {
    if (std::getenv("AT_SPI_BUS_ADDRESS") || std::getenv("DBUS_SESSION_BUS_ADDRESS"))
        return true;
    if (const char* folder = std::getenv("XDG_RUNTIME_DIR"))
        if (std::error_code error; std::filesystem::exists(std::filesystem::path(folder) / "bus", error))
            return true;
    const XConnection connection("");
    return connection.text(connection.root(), connection.atom("AT_SPI_BUS")).has_value();
}

bool Watcher::reach() {
    if (!hasBusAddress() || atspi_init() > 1)
        return false;
    atspi_set_timeout(s_callTimeout, s_callTimeout);
    AtspiEventListener* listener = atspi_event_listener_new(focusChanged, this, nullptr);
    GError* error = nullptr;
    const bool isRegistered = atspi_event_listener_register(listener, "object:state-changed:focused", &error);
    const Object<AtspiAccessible> desktop(atspi_get_desktop(0));
    if (!isRegistered || error || !desktop)
        return false;
    atspi_accessible_get_child_count(desktop.get(), &error);
    return error == nullptr;
}

void Watcher::run() {
    say("ready");
    g_unix_fd_add(STDIN_FILENO, static_cast<GIOCondition>(G_IO_IN | G_IO_HUP), inputArrived, this);
    atspi_event_main();
}

gboolean Watcher::inputArrived(gint descriptor, GIOCondition, gpointer self) {
    Watcher& watcher = *static_cast<Watcher*>(self);
    std::array<char, 1024> bytes{};
    const ssize_t count = read(descriptor, bytes.data(), bytes.size());
    if (count <= 0)
        std::_Exit(0); // the recorder has ended
    watcher.pending_.append(bytes.data(), static_cast<std::size_t>(count));
    std::string hover; // which may take long, so that what keys wait for is answered first
    for (std::size_t end = 0; (end = watcher.pending_.find('\n')) != std::string::npos;) {
        const std::string line = watcher.pending_.substr(0, end);
        watcher.pending_.erase(0, end + 1);
        if (line.starts_with("hover"))
            hover = line;
        else
            watcher.obey(line);
    }
    watcher.obey(hover);
    return G_SOURCE_CONTINUE;
}

void Watcher::say(const std::string& line) {
    std::cout << line << '\n' << std::flush;
}

void Watcher::obey(const std::string& line) {
    std::istringstream words(line);
    std::string what;
    words >> what;
    int x = 0;
    int y = 0;
    if (what == "window") {
        words >> process_;
    } else if (what == "ask") {
        say(std::string("answer ") + currentFocus());
    } else if (what == "hover" && words >> x >> y) {
        answerHover(x, y);
    }
}

void Watcher::focused(AtspiAccessible* accessible) {
    const std::uint32_t process = processOf(accessible);
    const bool isOnTop = isInActiveWindow(accessible);
    const char* kind = isOnTop ? kindOf(accessible) : "unknown";
    focus_.reset(isOnTop ? static_cast<AtspiAccessible*>(g_object_ref(accessible)) : nullptr);
    focusProcess_ = process;
    say("focus " + std::to_string(process) + " " + kind);
}

Object<AtspiAccessible> Watcher::applicationOf(std::uint32_t process) {
    const Object<AtspiAccessible> desktop(atspi_get_desktop(0));
    const int count = desktop ? atspi_accessible_get_child_count(desktop.get(), nullptr) : 0;
    for (int i = 0; i < count; ++i) {
        Object<AtspiAccessible> application(atspi_accessible_get_child_at_index(desktop.get(), i, nullptr));
        if (application && processOf(application.get()) == process)
            return application;
    }
    return nullptr;
}

Object<AtspiAccessible> Watcher::activeWindowOf(AtspiAccessible* application) {
    const int count = atspi_accessible_get_child_count(application, nullptr);
    isLate_ = isLate_ || count < 0;
    for (int i = 0; i < count; ++i) {
        Object<AtspiAccessible> window(atspi_accessible_get_child_at_index(application, i, nullptr));
        if (window && hasState(window.get(), ATSPI_STATE_ACTIVE))
            return window;
    }
    return nullptr;
}

/// Whether an object may have the focus as well as the field in it.
bool isAroundFields(AtspiAccessible* accessible) {
    switch (atspi_accessible_get_role(accessible, nullptr)) {
    case ATSPI_ROLE_FRAME:
    case ATSPI_ROLE_INTERNAL_FRAME:
    case ATSPI_ROLE_WINDOW:
    case ATSPI_ROLE_DIALOG:
    case ATSPI_ROLE_DOCUMENT_FRAME:
    case ATSPI_ROLE_DOCUMENT_WEB:
    case ATSPI_ROLE_DOCUMENT_TEXT:
    case ATSPI_ROLE_DOCUMENT_EMAIL:
    case ATSPI_ROLE_DOCUMENT_SPREADSHEET:
    case ATSPI_ROLE_DOCUMENT_PRESENTATION: return true;
    default: return false;
    }
}

/// Some documents have the state as well as the field in them, so the innermost object counts there. Any other object
/// that has it is what keys go to, however many objects are in it.
Object<AtspiAccessible> Watcher::focusIn(AtspiAccessible* accessible, int& visits) {
    if (++visits > s_visitedAtMost)
        return nullptr;
    const auto itself = [accessible] {
        return Object<AtspiAccessible>(static_cast<AtspiAccessible*>(g_object_ref(accessible)));
    };
    const bool hasFocus = hasState(accessible, ATSPI_STATE_FOCUSED);
    if (hasFocus && !isAroundFields(accessible))
        return itself();
    const int count = atspi_accessible_get_child_count(accessible, nullptr);
    for (int i = 0; i < count && visits <= s_visitedAtMost; ++i) {
        const Object<AtspiAccessible> child(atspi_accessible_get_child_at_index(accessible, i, nullptr));
        if (!child || !hasState(child.get(), ATSPI_STATE_SHOWING))
            continue;
        if (Object<AtspiAccessible> found = focusIn(child.get(), visits))
            return found;
    }
    return hasFocus && visits <= s_visitedAtMost ? itself() : nullptr;
}

bool Watcher::hasState(AtspiAccessible* accessible, AtspiStateType state) {
    const std::optional<bool> hasIt = stateOf(accessible, state);
    isLate_ = isLate_ || !hasIt;
    return hasIt.value_or(false);
}

bool Watcher::stillHasFocus() {
    if (!focus_ || focusProcess_ != process_)
        return false;
    atspi_accessible_clear_cache(focus_.get());
    return hasState(focus_.get(), ATSPI_STATE_FOCUSED);
}

/// The library's cache is out of date, because the application is asked for events of the focus alone.
void Watcher::searchFocus() {
    focusProcess_ = process_;
    const Object<AtspiAccessible> application = applicationOf(process_);
    if (!application)
        return;
    atspi_accessible_clear_cache(application.get());
    const Object<AtspiAccessible> window = activeWindowOf(application.get());
    int visits = 0;
    if (window)
        focus_ = focusIn(window.get(), visits);
}

/// Asks the application itself each time, so that its answer follows all events that it has sent before.
const char* Watcher::currentFocus() {
    constexpr const char* unknown = "unknown";
    if (process_ == 0)
        return unknown;
    isLate_ = false;
    if (stillHasFocus())
        return kindOf(focus_.get());
    focus_.reset();
    if (!isLate_)
        searchFocus();
    if (focus_)
        return kindOf(focus_.get());
    return isLate_ ? s_late : unknown;
}

/// Some applications answer with the innermost object, others with the child that it is in.
Object<AtspiAccessible> Watcher::innermostAt(AtspiAccessible* outer, int x, int y) {
    Object<AtspiAccessible> found;
    for (int depth = 0; depth < s_deepest; ++depth) {
        AtspiAccessible* around = found ? found.get() : outer;
        const Object<AtspiComponent> component(atspi_accessible_get_component_iface(around));
        Object<AtspiAccessible> next(
            component ? atspi_component_get_accessible_at_point(component.get(), x, y, ATSPI_COORD_TYPE_SCREEN, nullptr)
                      : nullptr);
        if (!next || next.get() == around)
            break;
        found = std::move(next);
    }
    return found;
}

void Watcher::answerHover(int x, int y) {
    const Object<AtspiAccessible> application = process_ ? applicationOf(process_) : nullptr;
    const Object<AtspiAccessible> window = application ? activeWindowOf(application.get()) : nullptr;
    const Object<AtspiAccessible> found = window ? innermostAt(window.get(), x, y) : nullptr;
    const Object<AtspiComponent> inner(found ? atspi_accessible_get_component_iface(found.get()) : nullptr);
    AtspiRect* area = inner ? atspi_component_get_extents(inner.get(), ATSPI_COORD_TYPE_SCREEN, nullptr) : nullptr;
    std::ostringstream line;
    line << "rect";
    const bool isIn = area && x >= area->x && y >= area->y && x < area->x + area->width && y < area->y + area->height;
    if (isIn)
        line << ' ' << area->x << ' ' << area->y << ' ' << area->width << ' ' << area->height;
    g_free(area);
    say(line.str());
}

} // namespace

int watchAccessibility() {
    Watcher watcher;
    if (!watcher.reach()) {
        std::cout << "absent\n" << std::flush;
        return 0;
    }
    watcher.run();
    return 0;
}

} // namespace Recorder
