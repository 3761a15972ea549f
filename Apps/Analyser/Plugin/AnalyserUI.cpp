#include <chrono>
#include <cmath>
#include <memory>

#include <DistrhoUI.hpp>

#include "AnalyserPlugin.h"
#include "Events.h"

START_NAMESPACE_DISTRHO

namespace {

using Hold = analyser::Processor::Hold;

constexpr uint kLeastWidth = 240, kLeastHeight = 160;
constexpr double kDoubleClick = 0.4, kDoubleClickPixels = 4.0;  // seconds

struct KeyPair {
    uint dpf;
    char32_t key;
};
constexpr KeyPair kKeys[] = {
    {kKeyEscape, analyser::kKeyEscape}, {0x0D, analyser::kKeyEnter},   {kKeyLeft, analyser::kKeyLeft},
    {kKeyRight, analyser::kKeyRight},   {kKeyUp, analyser::kKeyUp},    {kKeyDown, analyser::kKeyDown},
    {kKeyHome, analyser::kKeyHome},     {kKeyEnd, analyser::kKeyEnd},  {kKeyMenu, analyser::kKeyMenu},
    {kKeyF1, analyser::kKeyHelp},       {kKeyF10, analyser::kKeyMenu}, {kKeyF11, analyser::kKeyFullScreen},
};

float X(double value) { return static_cast<float>(value); }

// The view in a window that the host gives.
class AnalyserUI final : public UI {
public:
    AnalyserUI()
        : UI(DISTRHO_UI_DEFAULT_WIDTH, DISTRHO_UI_DEFAULT_HEIGHT),
          m_processor(static_cast<AnalyserPlugin*>(getPluginInstancePointer())->GetProcessor()) {
        setGeometryConstraints(kLeastWidth, kLeastHeight, false, false);
        m_processor.SetClipboard([this](const std::string& text) {
            return setClipboard("text/plain", text.c_str(), text.size());
        });
    }
    ~AnalyserUI() override {
        m_processor.SetClipboard({});
        Hold(m_processor)->PointerLeft();
    }

protected:
    void parameterChanged(uint32_t, float) override {}
    void stateChanged(const char*, const char*) override { repaint(); }
    void uiIdle() override {
        if (m_processor.TakeChanged()) repaint();
    }

    // Into memory first: the host's surface may lie behind a connection that every line would travel over.
    void onCairoDisplay(const CairoGraphicsContext& context) override {
        const int width = static_cast<int>(getWidth()), height = static_cast<int>(getHeight());
        if (width < 1 || height < 1) return;
        if (!m_image || width != cairo_image_surface_get_width(m_image.get()) ||
            height != cairo_image_surface_get_height(m_image.get()))
            m_image.reset(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height));
        cairo_t* const drawing = cairo_create(m_image.get());
        Hold(m_processor)->Draw(drawing, width, height, 96.0f * X(getScaleFactor()));
        cairo_destroy(drawing);
        cairo_set_source_surface(context.handle, m_image.get(), 0.0, 0.0);
        cairo_paint(context.handle);
    }

    bool onKeyboard(const KeyboardEvent& event) override {
        if (!event.press) return false;
        const bool control = (event.mod & kModifierControl) != 0;
        for (const KeyPair& pair : kKeys)
            if (pair.dpf == event.key) return Shown(Hold(m_processor)->KeyDown({pair.key, control}));
        return control && event.key < 0x80 && Shown(Hold(m_processor)->KeyDown({event.key, true}));
    }
    bool onCharacterInput(const CharacterInputEvent& event) override {
        const uint c = event.character;
        if (c < 0x20 || c >= 0x7F || (event.mod & (kModifierControl | kModifierAlt)) != 0) return false;
        return Shown(Hold(m_processor)->KeyDown({c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c}));
    }
    bool onMouse(const MouseEvent& event) override {
        const double x = event.pos.getX(), y = event.pos.getY();
        if (event.button != kMouseButtonLeft && event.button != kMouseButtonRight) return false;
        if (!event.press) {
            if (event.button == kMouseButtonLeft) Hold(m_processor)->Release(X(x), X(y));
            return Shown(true);
        }
        const auto now = std::chrono::steady_clock::now();
        const bool again = std::chrono::duration<double>(now - m_pressed).count() < kDoubleClick &&
                           std::hypot(x - m_x, y - m_y) < kDoubleClickPixels;
        m_pressed = again ? std::chrono::steady_clock::time_point{} : now;
        m_x = x;
        m_y = y;
        const auto button =
            event.button == kMouseButtonLeft ? analyser::Button::Left : analyser::Button::Right;
        Hold(m_processor)->Press({button, X(x), X(y), again ? 2 : 1});
        return Shown(true);
    }
    bool onMotion(const MotionEvent& event) override {
        Hold(m_processor)->PointTo(X(event.pos.getX()), X(event.pos.getY()));
        return false;
    }
    bool onScroll(const ScrollEvent& event) override {
        Hold(m_processor)
            ->Wheel(X(event.pos.getX()), X(event.pos.getY()), X(event.delta.getY()),
                    (event.mod & kModifierControl) != 0);
        return Shown(true);
    }

private:
    struct Closer {
        void operator()(cairo_surface_t* surface) const { cairo_surface_destroy(surface); }
    };

    bool Shown(bool used) {
        if (used) repaint();
        return used;
    }

    analyser::Processor& m_processor;
    std::unique_ptr<cairo_surface_t, Closer> m_image;
    std::chrono::steady_clock::time_point m_pressed{};
    double m_x = 0.0, m_y = 0.0;
};

}  // namespace

UI* createUI() { return new AnalyserUI; }

END_NAMESPACE_DISTRHO
