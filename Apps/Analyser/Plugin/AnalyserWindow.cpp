#include "AnalyserWindow.h"

#include <cairo-xcb.h>
#include <xcb/xcb.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdlib>
#include <exception>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Events.h"

namespace analyser {
namespace {

using Hold = Processor::Hold;
using Clock = std::chrono::steady_clock;

constexpr int kWidth = 960, kHeight = 600, kLeastWidth = 240, kLeastHeight = 160, kMost = 16384;
constexpr std::uint32_t kDark = 0x0e1116;                       // where nothing is drawn yet
constexpr double kDoubleClick = 0.4, kDoubleClickPixels = 4.0;  // seconds
constexpr std::uint32_t kEvents = XCB_EVENT_MASK_EXPOSURE | XCB_EVENT_MASK_STRUCTURE_NOTIFY |
                                  XCB_EVENT_MASK_KEY_PRESS | XCB_EVENT_MASK_BUTTON_PRESS |
                                  XCB_EVENT_MASK_BUTTON_RELEASE | XCB_EVENT_MASK_POINTER_MOTION |
                                  XCB_EVENT_MASK_LEAVE_WINDOW;

struct KeyPair {
    xcb_keysym_t symbol;
    char32_t key;
};
constexpr KeyPair kKeys[] = {
    {0xff1b, kKeyEscape},     {0xff0d, kKeyEnter}, {0xff8d, kKeyEnter}, {0xff51, kKeyLeft},
    {0xff53, kKeyRight},      {0xff52, kKeyUp},    {0xff54, kKeyDown},  {0xff50, kKeyHome},
    {0xff57, kKeyEnd},        {0xff67, kKeyMenu},  {0xffbe, kKeyHelp},  {0xffc7, kKeyMenu},
    {0xffc8, kKeyFullScreen},
};

struct Free {
    void operator()(void* reply) const { std::free(reply); }
};
template <typename Reply>
std::unique_ptr<Reply, Free> Own(Reply* reply) {
    return std::unique_ptr<Reply, Free>(reply);
}

struct CloseSurface {
    void operator()(cairo_surface_t* surface) const { cairo_surface_destroy(surface); }
};
using Surface = std::unique_ptr<cairo_surface_t, CloseSurface>;

// XCB and not Xlib: when the host has destroyed the parent, Xlib would end the host.
class AnalyserWindow final : public Corvo::Plugins::Window {
public:
    explicit AnalyserWindow(Processor& processor)
        : m_processor(processor), m_connection(xcb_connect(nullptr, nullptr)) {
        if (!IsConnected()) return;
        m_screen = xcb_setup_roots_iterator(xcb_get_setup(m_connection)).data;
        SetScale(DisplayScale());
    }
    ~AnalyserWindow() override {
        Close();
        xcb_disconnect(m_connection);
    }

    bool IsConnected() const { return xcb_connection_has_error(m_connection) == 0; }

    void SetScale(double scale) override {
        if (!(scale >= 0.25 && scale <= 8.0)) return;
        m_scale = scale;
        if (m_window == 0)
            m_size = Fitting({static_cast<int>(kWidth * scale), static_cast<int>(kHeight * scale)});
        m_dirty = true;
    }
    Size GetSize() const override { return m_size; }
    Size Fitting(Size size) const override {
        return {std::clamp(size.width, kLeastWidth, kMost), std::clamp(size.height, kLeastHeight, kMost)};
    }
    void Resize(Size size) override {
        m_size = Fitting(size);
        const std::uint32_t values[]{static_cast<std::uint32_t>(m_size.width),
                                     static_cast<std::uint32_t>(m_size.height)};
        if (m_window == 0) return;
        xcb_configure_window(m_connection, m_window, XCB_CONFIG_WINDOW_WIDTH | XCB_CONFIG_WINDOW_HEIGHT,
                             values);
        xcb_flush(m_connection);
    }

    bool Open(std::uintptr_t parent) override;
    void Close() override;
    std::uintptr_t Handle() const override { return m_window; }
    void Show(bool on) override {
        if (m_window == 0) return;
        if (on)
            xcb_map_window(m_connection, m_window);
        else
            xcb_unmap_window(m_connection, m_window);
        xcb_flush(m_connection);
    }
    void Idle() override;

private:
    double DisplayScale() const;
    xcb_atom_t Atom(std::string_view name) const;
    void ReadKeys();
    void Handle(const xcb_generic_event_t& event);
    void HandleKey(const xcb_key_press_event_t& event);
    void HandleButton(const xcb_button_press_event_t& event);
    void GiveClipboard(const xcb_selection_request_event_t& request) const;
    bool Copy(const std::string& text);
    bool IsSeen() const;
    void Draw();
    // The view with this window's places.
    Hold Placed() {
        if (!m_processor.IsDrawnFor(this)) Draw();
        return Hold(m_processor);
    }

    Processor& m_processor;
    xcb_connection_t* const m_connection;
    xcb_screen_t* m_screen = nullptr;
    xcb_window_t m_window = 0;
    xcb_atom_t m_clipboard = 0, m_targets = 0, m_utf8 = 0;
    std::vector<xcb_keysym_t> m_symbols;  // of the keyboard, so many for each key
    std::size_t m_symbolsPerKey = 0;
    std::string m_copied;
    Surface m_surface, m_image;
    double m_scale = 1.0;
    Size m_size{kWidth, kHeight};
    bool m_dirty = true;
    unsigned m_drawn = 0;  // changes of the processor's
    Clock::time_point m_pressed{};
    float m_x = 0.0f, m_y = 0.0f;
};

xcb_visualtype_t* VisualOf(const xcb_screen_t* screen) {
    for (auto depth = xcb_screen_allowed_depths_iterator(screen); depth.rem > 0; xcb_depth_next(&depth))
        for (auto visual = xcb_depth_visuals_iterator(depth.data); visual.rem > 0;
             xcb_visualtype_next(&visual))
            if (visual.data->visual_id == screen->root_visual) return visual.data;
    return nullptr;
}

// What desktops write for programs: "Xft.dpi:	192".
double AnalyserWindow::DisplayScale() const {
    constexpr std::string_view kName = "Xft.dpi:";
    const auto reply =
        Own(xcb_get_property_reply(m_connection,
                                   xcb_get_property(m_connection, 0, m_screen->root,
                                                    XCB_ATOM_RESOURCE_MANAGER, XCB_ATOM_STRING, 0, 1 << 16),
                                   nullptr));
    if (!reply) return 1.0;
    const std::string text(static_cast<const char*>(xcb_get_property_value(reply.get())),
                           static_cast<std::size_t>(xcb_get_property_value_length(reply.get())));
    const auto at = text.find(kName);
    return at == text.npos ? 1.0 : std::strtod(text.c_str() + at + kName.size(), nullptr) / 96.0;
}

xcb_atom_t AnalyserWindow::Atom(std::string_view name) const {
    const auto reply = Own(xcb_intern_atom_reply(
        m_connection, xcb_intern_atom(m_connection, 0, static_cast<std::uint16_t>(name.size()), name.data()),
        nullptr));
    return reply ? reply->atom : xcb_atom_t{XCB_ATOM_NONE};
}

void AnalyserWindow::ReadKeys() {
    const auto* const setup = xcb_get_setup(m_connection);
    const auto reply = Own(xcb_get_keyboard_mapping_reply(
        m_connection,
        xcb_get_keyboard_mapping(m_connection, setup->min_keycode,
                                 static_cast<std::uint8_t>(setup->max_keycode - setup->min_keycode + 1)),
        nullptr));
    if (!reply) return;
    const auto* const first = xcb_get_keyboard_mapping_keysyms(reply.get());
    m_symbols.assign(first, first + xcb_get_keyboard_mapping_keysyms_length(reply.get()));
    m_symbolsPerKey = reply->keysyms_per_keycode;
}

bool AnalyserWindow::Open(std::uintptr_t parent) try {
    auto* const visual = VisualOf(m_screen);
    if (m_window != 0 || !IsConnected() || !visual) return false;
    m_clipboard = Atom("CLIPBOARD");
    m_targets = Atom("TARGETS");
    m_utf8 = Atom("UTF8_STRING");
    ReadKeys();
    const std::uint32_t values[]{kDark, kDark, XCB_GRAVITY_NORTH_WEST, kEvents, m_screen->default_colormap};
    const auto window = xcb_generate_id(m_connection);
    const auto made = xcb_create_window_checked(
        m_connection, m_screen->root_depth, window, static_cast<xcb_window_t>(parent), 0, 0,
        static_cast<std::uint16_t>(m_size.width), static_cast<std::uint16_t>(m_size.height), 0,
        XCB_WINDOW_CLASS_INPUT_OUTPUT, visual->visual_id,
        XCB_CW_BACK_PIXEL | XCB_CW_BORDER_PIXEL | XCB_CW_BIT_GRAVITY | XCB_CW_EVENT_MASK | XCB_CW_COLORMAP,
        values);
    if (const auto error = Own(xcb_request_check(m_connection, made))) return false;
    m_window = window;
    m_surface.reset(cairo_xcb_surface_create(m_connection, window, visual, m_size.width, m_size.height));
    m_processor.AddWindow(this, [this](const std::string& text) { return Copy(text); });
    m_dirty = true;
    Show(true);
    return true;
} catch (const std::exception&) {
    return false;  // no memory
}

void AnalyserWindow::Close() {
    if (m_window == 0) return;
    m_processor.RemoveWindow(this);
    Hold(m_processor)->PointerLeft();
    // Cairo knows connections by their address, which the next one may have again.
    cairo_device_t* const device = cairo_device_reference(cairo_surface_get_device(m_surface.get()));
    m_surface.reset();
    m_image.reset();
    cairo_device_finish(device);
    cairo_device_destroy(device);
    xcb_destroy_window(m_connection, m_window);
    xcb_flush(m_connection);
    m_window = 0;
}

void AnalyserWindow::Idle() try {
    while (m_window != 0) {
        const auto event = Own(xcb_poll_for_event(m_connection));
        if (!event) break;
        Handle(*event);
    }
    if (m_window == 0) return;
    const unsigned changes = m_processor.Changes();
    if (std::exchange(m_drawn, changes) != changes) m_dirty = true;
    if (m_dirty && IsConnected() && IsSeen()) {
        m_dirty = false;
        Draw();
    }
} catch (const std::exception&) {
    // No memory: another time.
}

bool AnalyserWindow::IsSeen() const {
    const auto reply = Own(xcb_get_window_attributes_reply(
        m_connection, xcb_get_window_attributes(m_connection, m_window), nullptr));
    return reply && reply->map_state == XCB_MAP_STATE_VIEWABLE;
}

// Into memory first: the host's surface may lie behind a connection that every line would travel over.
void AnalyserWindow::Draw() {
    const auto [width, height] = m_size;
    if (!m_image || width != cairo_image_surface_get_width(m_image.get()) ||
        height != cairo_image_surface_get_height(m_image.get()))
        m_image.reset(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height));
    cairo_t* context = cairo_create(m_image.get());
    Hold(m_processor)->Draw(context, width, height, static_cast<float>(96.0 * m_scale));
    m_processor.SetDrawn(this);
    cairo_destroy(context);
    context = cairo_create(m_surface.get());
    cairo_set_source_surface(context, m_image.get(), 0.0, 0.0);
    cairo_paint(context);
    cairo_destroy(context);
    cairo_surface_flush(m_surface.get());
    xcb_flush(m_connection);
}

void AnalyserWindow::Handle(const xcb_generic_event_t& event) {
    switch (event.response_type & 0x7f) {
        case XCB_DESTROY_NOTIFY:
            Close();
            break;  // with its parent
        case XCB_EXPOSE:
            m_dirty = true;
            break;
        case XCB_CONFIGURE_NOTIFY: {
            const auto& change = reinterpret_cast<const xcb_configure_notify_event_t&>(event);
            m_size = {change.width, change.height};
            cairo_xcb_surface_set_size(m_surface.get(), change.width, change.height);
            m_dirty = true;
            break;
        }
        case XCB_KEY_PRESS:
            HandleKey(reinterpret_cast<const xcb_key_press_event_t&>(event));
            break;
        case XCB_BUTTON_PRESS:
            HandleButton(reinterpret_cast<const xcb_button_press_event_t&>(event));
            break;
        case XCB_BUTTON_RELEASE: {
            const auto& press = reinterpret_cast<const xcb_button_release_event_t&>(event);
            if (press.detail == XCB_BUTTON_INDEX_1) Placed()->Release(press.event_x, press.event_y);
            m_dirty = true;
            break;
        }
        case XCB_MOTION_NOTIFY: {
            const auto& motion = reinterpret_cast<const xcb_motion_notify_event_t&>(event);
            Placed()->PointTo(motion.event_x, motion.event_y);
            break;
        }
        case XCB_LEAVE_NOTIFY: {
            const auto& leave = reinterpret_cast<const xcb_leave_notify_event_t&>(event);
            if ((leave.state & XCB_BUTTON_MASK_1) == 0) Hold(m_processor)->PointerLeft();
            break;
        }
        case XCB_MAPPING_NOTIFY:
            ReadKeys();
            break;
        case XCB_SELECTION_REQUEST:
            GiveClipboard(reinterpret_cast<const xcb_selection_request_event_t&>(event));
            break;
        default:
            break;
    }
}

// Levels of the keyboard: plain, with shift, and two steps further with the key for third symbols.
void AnalyserWindow::HandleKey(const xcb_key_press_event_t& event) {
    constexpr std::uint16_t kThird = XCB_MOD_MASK_5, kNumbers = XCB_MOD_MASK_2;
    const std::size_t first =
        static_cast<std::size_t>(event.detail - xcb_get_setup(m_connection)->min_keycode) * m_symbolsPerKey;
    const auto symbol = [&](std::size_t level) {
        return level < m_symbolsPerKey && first + level < m_symbols.size() ? m_symbols[first + level] : 0;
    };
    const auto isOfKeypad = [](xcb_keysym_t s) { return s >= 0xffaa && s <= 0xffb9; };
    const std::size_t level = (event.state & XCB_MOD_MASK_SHIFT ? 1 : 0) + (event.state & kThird ? 4 : 0);
    xcb_keysym_t key = symbol(level);
    if (key == 0) key = symbol(0);
    if ((event.state & kNumbers) != 0 && isOfKeypad(symbol(1))) key = symbol(1);
    if (isOfKeypad(key)) key -= 0xff80;
    if (key >= 'A' && key <= 'Z') key += 'a' - 'A';
    const bool control = (event.state & XCB_MOD_MASK_CONTROL) != 0;
    const auto* const named = std::ranges::find(kKeys, key, &KeyPair::symbol);
    if (named != std::end(kKeys))
        m_dirty |= Hold(m_processor)->KeyDown({named->key, control});
    else if (key >= 0x20 && key < 0x7f && (event.state & XCB_MOD_MASK_1) == 0)
        m_dirty |= Hold(m_processor)->KeyDown({static_cast<char32_t>(key), control});
}

void AnalyserWindow::HandleButton(const xcb_button_press_event_t& event) {
    enum { kLeft = 1, kRight = 3, kUp = 4, kDown = 5, kWheelLeft = 6, kWheelRight = 7 };
    const float x = event.event_x, y = event.event_y;
    m_dirty = true;
    const bool shift = (event.state & XCB_MOD_MASK_SHIFT) != 0;
    const bool back = event.detail == kWheelLeft || (shift && event.detail == kUp);
    if (back || event.detail == kWheelRight || (shift && event.detail == kDown)) {
        Hold(m_processor)->ScrollBack(back ? 1.0f : -1.0f);
        return;
    }
    if (event.detail == kUp || event.detail == kDown) {
        const bool control = (event.state & XCB_MOD_MASK_CONTROL) != 0;
        Placed()->Wheel(x, y, event.detail == kUp ? 1.0f : -1.0f, control);
        return;
    }
    if (event.detail != kLeft && event.detail != kRight) return;
    xcb_set_input_focus(m_connection, XCB_INPUT_FOCUS_PARENT, m_window, event.time);
    const auto now = Clock::now();
    const bool again = std::chrono::duration<double>(now - m_pressed).count() < kDoubleClick &&
                       std::hypot(x - m_x, y - m_y) < kDoubleClickPixels;
    m_pressed = again ? Clock::time_point{} : now;
    m_x = x;
    m_y = y;
    Placed()->Press({event.detail == kLeft ? Button::Left : Button::Right, x, y, again ? 2 : 1});
}

bool AnalyserWindow::Copy(const std::string& text) {
    m_copied = text;
    xcb_set_selection_owner(m_connection, m_window, m_clipboard, XCB_CURRENT_TIME);
    xcb_flush(m_connection);
    return true;
}

void AnalyserWindow::GiveClipboard(const xcb_selection_request_event_t& request) const {
    const auto to = request.property != XCB_ATOM_NONE ? request.property : request.target;
    xcb_selection_notify_event_t answer{};
    answer.response_type = XCB_SELECTION_NOTIFY;
    answer.time = request.time;
    answer.requestor = request.requestor;
    answer.selection = request.selection;
    answer.target = request.target;
    answer.property = to;
    if (request.target == m_targets) {
        const xcb_atom_t known[]{m_targets, m_utf8, XCB_ATOM_STRING};
        xcb_change_property(m_connection, XCB_PROP_MODE_REPLACE, request.requestor, to, XCB_ATOM_ATOM, 32,
                            std::size(known), known);
    } else if (request.target == m_utf8 || request.target == XCB_ATOM_STRING) {
        xcb_change_property(m_connection, XCB_PROP_MODE_REPLACE, request.requestor, to, request.target, 8,
                            static_cast<std::uint32_t>(m_copied.size()), m_copied.data());
    } else {
        answer.property = XCB_ATOM_NONE;
    }
    xcb_send_event(m_connection, 0, request.requestor, 0, reinterpret_cast<const char*>(&answer));
    xcb_flush(m_connection);
}

}  // namespace

std::unique_ptr<Corvo::Plugins::Window> MakeAnalyserWindow(Processor& processor) {
    auto window = std::make_unique<AnalyserWindow>(processor);
    return window->IsConnected() ? std::move(window) : nullptr;
}

}  // namespace analyser
