// Windows: opened and closed again and again inside of one of the host's, clicked, typed into, of any size,
// and when the host's goes first.
#include <malloc.h>
#include <xcb/xcb.h>

#include <chrono>
#include <cstdlib>
#include <memory>
#include <set>
#include <thread>

#include "Checks.h"

namespace PluginHost {
namespace {

constexpr int kRounds = 10, kWarm = 3;
constexpr long kMostMore = 128;  // KiB

template <typename Reply>
std::unique_ptr<Reply, decltype(&std::free)> Own(Reply* reply) {
    return {reply, std::free};
}

// The host's window on the display.
class Parent {
public:
    Parent() : m_connection(xcb_connect(nullptr, nullptr)), m_window(xcb_generate_id(m_connection)) {
        const xcb_screen_t& screen = *xcb_setup_roots_iterator(xcb_get_setup(m_connection)).data;
        xcb_create_window(m_connection, XCB_COPY_FROM_PARENT, m_window, screen.root, 0, 0, 1600, 1000, 0,
                          XCB_WINDOW_CLASS_INPUT_OUTPUT, screen.root_visual, XCB_CW_BACK_PIXEL,
                          &screen.white_pixel);
        xcb_map_window(m_connection, m_window);
        Child();
    }
    ~Parent() {
        Destroy();
        xcb_disconnect(m_connection);
    }
    Parent(const Parent&) = delete;

    std::uintptr_t Handle() const { return m_window; }
    void Destroy() {
        xcb_destroy_window(m_connection, m_window);
        Child();
    }
    // What the plug-in opened in it; 0 where there is nothing.
    xcb_window_t Child() {
        const auto tree =
            Own(xcb_query_tree_reply(m_connection, xcb_query_tree(m_connection, m_window), nullptr));
        return tree && tree->children_len > 0 ? *xcb_query_tree_children(tree.get()) : 0;
    }
    std::size_t Colours() {
        const auto size =
            Own(xcb_get_geometry_reply(m_connection, xcb_get_geometry(m_connection, Child()), nullptr));
        if (!size) return 0;
        const auto image =
            Own(xcb_get_image_reply(m_connection,
                                    xcb_get_image(m_connection, XCB_IMAGE_FORMAT_Z_PIXMAP, Child(), 0, 0,
                                                  size->width, size->height, ~0u),
                                    nullptr));
        if (!image) return 0;
        const auto* const pixels = reinterpret_cast<const std::uint32_t*>(xcb_get_image_data(image.get()));
        return std::set(pixels, pixels + xcb_get_image_data_length(image.get()) / 4).size();
    }
    // A key or a button, whichever the type is.
    void Send(std::uint8_t type, unsigned detail, int x, int y) {
        xcb_button_press_event_t event{};
        event.response_type = type;
        event.detail = static_cast<std::uint8_t>(detail);
        event.event = Child();
        event.event_x = static_cast<std::int16_t>(x);
        event.event_y = static_cast<std::int16_t>(y);
        xcb_send_event(m_connection, 0, Child(), 0, reinterpret_cast<const char*>(&event));
        xcb_flush(m_connection);
    }

private:
    xcb_connection_t* const m_connection;
    const xcb_window_t m_window;
};

long Used() {
    const auto memory = mallinfo2();
    return static_cast<long>((memory.uordblks + memory.hblkhd) / 1024);
}

void Tick(Window& window, int times) {
    for (int i = 0; i < times; ++i) {
        std::this_thread::sleep_for(std::chrono::milliseconds(33));
        window.Tick();
    }
}

void UseWindow(Instance& plugin, Window& window, Parent& parent) {
    std::mt19937 random(3);
    Tick(window, 6);
    Expect(parent.Child() != 0, "its window is not in the host's");
    Expect(parent.Colours() > 50, "its window is empty");
    std::set<Bytes> states;
    for (const unsigned key : {13u, 11u, 12u}) {  // "4", "2" and "3", each after Escape for what is open
        for (const unsigned each : {9u, 9u, 9u, key}) parent.Send(XCB_KEY_PRESS, each, 0, 0);
        Tick(window, 2);
        states.insert(plugin.Save());
    }
    Expect(states.size() == 3, "does not do what is typed into its window");
    for (int i = 0; i < 20; ++i) {
        Expect(window.Resize(static_cast<int>(random() % 2000), static_cast<int>(random() % 1200)),
               "its window has no other size");
        const int x = static_cast<int>(random() % 900), y = static_cast<int>(random() % 500);
        const auto button = static_cast<unsigned>(1 + random() % 5),
                   key = static_cast<unsigned>(9 + random() % 100);
        for (const unsigned type : {XCB_BUTTON_PRESS, XCB_MOTION_NOTIFY, XCB_BUTTON_RELEASE})
            parent.Send(static_cast<std::uint8_t>(type), button, x, y);
        parent.Send(XCB_KEY_PRESS, key, x, y);
        window.Tick();
    }
    Expect(window.Resize(800, 500), "its window has no other size");
    Tick(window, 3);
    Expect(parent.Colours() > 20, "its window is empty after other sizes");
}

}  // namespace

void CheckWindow(PluginFile& file, std::size_t index) {
    static const Parent another;  // some displays begin anew after their last window
    long before = 0;
    for (int round = 0; round < kRounds; ++round) {
        if (round == kWarm) before = Used();
        const auto plugin = file.Create(index);
        plugin->Activate(48000, 1024);
        Render(*plugin, Noise(*plugin, 24000));
        for (const bool parentGoesFirst : {false, true}) {
            Parent parent;
            auto window = plugin->MakeWindow();
            if (!window || !window->Open(parent.Handle())) return Finding("has no window");
            UseWindow(*plugin, *window, parent);
            if (parentGoesFirst) parent.Destroy();
            Tick(*window, 1);
            window.reset();
            Expect(parent.Child() == 0, "leaves its window behind");
        }
        plugin->Deactivate();
    }
    const long more = Used() - before;
    std::printf("%ld KiB more after %d windows\n", more, 2 * (kRounds - kWarm));
    Expect(more < kMostMore, "keeps memory of windows that are closed");
}

}  // namespace PluginHost
