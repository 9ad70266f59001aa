#include "Tools/record/TrafficObserver.h"

#include "Tools/record/XConnection.h"

#include <X11/Xlib.h>
#include <X11/Xproto.h>
#include <X11/extensions/record.h>
#include <sys/socket.h>

#include <algorithm>
#include <bitset>
#include <cstring>
#include <map>
#include <utility>

namespace Recorder {

namespace {

constexpr int s_hideCursor = 29; ///< requests of XFixes
constexpr int s_showCursor = 30;
constexpr std::size_t s_keys = 256;

struct DisplayCloser {
    void operator()(Display* display) const { XCloseDisplay(display); }
};
using DisplayPointer = std::unique_ptr<Display, DisplayCloser>;

template <class Range>
void setRange(Range& range, int first, int last) {
    range.first = static_cast<decltype(range.first)>(first);
    range.last = static_cast<decltype(range.last)>(last);
}

} // namespace

struct TrafficObserver::State {
    Events events;
    DisplayPointer control;
    DisplayPointer data; ///< of which the server takes over the answers
    XRecordContext context = 0;
    int fixes = 0; ///< number of the extension's requests
    std::bitset<s_keys> down;
    std::map<XID, int> hides; ///< how often each client has hidden the cursor
    bool isBroken = false;    ///< the display is gone

    bool open(const std::string& display);
    void survive(Display* connection);
    void take(const XRecordInterceptData& intercepted);
    void takeKey(const xEvent& event);
    void takeRequest(const XRecordInterceptData& intercepted);
    void tellHidden(Time time);
};

/// Xlib would end the program at an error and when the display goes away, though there is a recording to save.
void TrafficObserver::State::survive(Display* connection) {
    const auto note = [](Display*, void* self) { static_cast<State*>(self)->isBroken = true; };
    XSetErrorHandler([](Display*, XErrorEvent*) { return 0; }); // such as that of a client that has just ended
    XSetIOErrorHandler([](Display*) { return 0; });             // which would say so
    XSetIOErrorExitHandler(connection, note, this);
}

bool TrafficObserver::State::open(const std::string& display) {
    const char* name = display.empty() ? nullptr : display.c_str();
    control.reset(XOpenDisplay(name));
    data.reset(XOpenDisplay(name));
    int major = 0;
    int minor = 0;
    for (const DisplayPointer* one : {&control, &data})
        if (*one)
            survive(one->get());
    if (!control || !data || !XRecordQueryVersion(control.get(), &major, &minor))
        return false;
    int firstEvent = 0;
    int firstError = 0;
    XQueryExtension(control.get(), "XFIXES", &fixes, &firstEvent, &firstError);
    const std::unique_ptr<XRecordRange, decltype(&XFree)> keys(XRecordAllocRange(), XFree);
    const std::unique_ptr<XRecordRange, decltype(&XFree)> requests(XRecordAllocRange(), XFree);
    setRange(keys->device_events, KeyPress, KeyRelease);
    setRange(requests->ext_requests.ext_major, fixes, fixes);
    setRange(requests->ext_requests.ext_minor, s_hideCursor, s_showCursor);
    requests->client_died = True;
    XRecordClientSpec clients = XRecordAllClients;
    XRecordRange* ranges[] = {keys.get(), requests.get()};
    context = XRecordCreateContext(control.get(), 0, &clients, 1, ranges, fixes != 0 ? 2 : 1);
    XSync(control.get(), False);
    const auto take = [](XPointer self, XRecordInterceptData* intercepted) {
        reinterpret_cast<State*>(self)->take(*intercepted);
        XRecordFreeData(intercepted);
    };
    return context != 0 && XRecordEnableContextAsync(data.get(), context, take, reinterpret_cast<XPointer>(this)) != 0;
}

void TrafficObserver::State::take(const XRecordInterceptData& intercepted) {
    if (intercepted.category == XRecordFromServer && intercepted.data_len * 4 >= sizeof(xEvent)) {
        xEvent event;
        std::memcpy(&event, intercepted.data, sizeof(event));
        takeKey(event);
    } else if (intercepted.category == XRecordFromClient || intercepted.category == XRecordClientDied) {
        takeRequest(intercepted);
    }
}

void TrafficObserver::State::takeKey(const xEvent& event) {
    const std::uint8_t key = event.u.u.detail;
    const bool isPress = (event.u.u.type & s_eventTypeBits) == KeyPress;
    if (isPress && down[key])
        events.keyRepeated(event.u.keyButtonPointer.time, key);
    down[key] = isPress;
}

void TrafficObserver::State::takeRequest(const XRecordInterceptData& intercepted) {
    if (intercepted.category == XRecordClientDied) {
        hides.erase(intercepted.id_base);
    } else if (intercepted.data_len > 0) {
        int& count = hides[intercepted.id_base];
        count = intercepted.data[1] == s_hideCursor ? count + 1 : std::max(0, count - 1);
    }
    tellHidden(intercepted.server_time);
}

void TrafficObserver::State::tellHidden(Time time) {
    const bool isHidden = std::any_of(hides.begin(), hides.end(), [](const auto& hide) { return hide.second > 0; });
    events.cursorHidden(static_cast<std::uint32_t>(time), isHidden);
}

TrafficObserver::TrafficObserver(const std::string& display, Events events) : state_(std::make_unique<State>()) {
    state_->events = std::move(events);
    if (!state_->open(display))
        state_->data.reset();
}

TrafficObserver::~TrafficObserver() {
    for (const DisplayPointer* one : {&state_->control, &state_->data})
        if (*one) // closing a display would wait for a server that may hang
            shutdown(ConnectionNumber(one->get()), SHUT_RDWR);
}

int TrafficObserver::descriptor() const {
    return state_->data && !state_->isBroken ? ConnectionNumber(state_->data.get()) : -1;
}

void TrafficObserver::serve() {
    if (state_->data && !state_->isBroken)
        XRecordProcessReplies(state_->data.get());
}

} // namespace Recorder
