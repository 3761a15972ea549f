#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string_view>
#include <tuple>
#include <vector>

#include <cairo.h>

#include "Drawing/Backends/DrawingCairo.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#include "Support/Signals.h"

// What does a frame cost, analysed and drawn, and which share of a core is that 30 times a second ("core")?
// Beside it stand the same fills, strokes and pictures, without texts, in bare Cairo (BM_BareFrame).
namespace {

using Corvo::DrawingBitmap;
using Corvo::DrawingCairo;
using Corvo::Ink;
using Corvo::PointF;
using Corvo::RectF;
using Corvo::Stroke;

constexpr int kRate = 48000, kRefresh = kRate / 30;

enum View { kSpectrum, kFilled, kBars, kSonogram, kTuner, kAll };
constexpr const char* kViews[] = {"spectrum", "filled spectrum", "bars", "sonogram", "tuner", "all three"};

class Surface {
public:
    Surface(int width, int height)
        : m_surface(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height)) {
        context = cairo_create(m_surface);
    }
    ~Surface() {
        cairo_destroy(context);
        cairo_surface_destroy(m_surface);
    }
    Surface(const Surface&) = delete;
    Surface& operator=(const Surface&) = delete;
    cairo_t* context;

private:
    cairo_surface_t* m_surface;
};

// What is drawn, as calls of Cairo that do the same in the plainest way; texts are measured only. A picture
// is kept as it was when it was first drawn: what it shows does not matter, but that it is the same memory.
class Recorder final : public Corvo::DrawTarget {
public:
    explicit Recorder(Corvo::DrawTarget& measures) : Corvo::DrawTarget(96.0f), m_measures(measures) {}
    void Replay(cairo_t* context) const {
        for (const auto& call : m_calls) call(context);
    }

    void Clear(Corvo::ColourReference colour) override { Add({colour}, cairo_paint); }
    void Polyline(const PointF* points, int count, const Stroke& stroke) override {
        Add(stroke.ink, [path = std::vector(points, points + count), width = stroke.width](cairo_t* c) {
            cairo_set_line_width(c, width);
            cairo_set_line_join(c, CAIRO_LINE_JOIN_ROUND);
            cairo_set_line_cap(c, CAIRO_LINE_CAP_ROUND);
            for (const PointF& point : path) cairo_line_to(c, point.x, point.y);
            cairo_stroke(c);
        });
    }
    void FillPolygon(const PointF* points, int count, Ink ink) override {
        Add(ink, [path = std::vector(points, points + count)](cairo_t* c) {
            for (const PointF& point : path) cairo_line_to(c, point.x, point.y);
            cairo_fill(c);
        });
    }
    void FillRectangle(const RectF& r, Ink ink) override {
        Add(ink, [r](cairo_t* c) {
            cairo_rectangle(c, r.x, r.y, r.width, r.height);
            cairo_fill(c);
        });
    }
    void OutlineRectangle(const RectF& r, const Stroke& stroke) override {
        Add(stroke.ink, [r, half = stroke.width / 2.0f](cairo_t* c) {
            cairo_set_line_width(c, 2.0f * half);
            cairo_rectangle(c, r.x + half, r.y + half, r.width - 2.0f * half, r.height - 2.0f * half);
            cairo_stroke(c);
        });
    }
    void FillRoundedRectangle(const RectF& r, float, Ink ink) override { FillRectangle(r, ink); }
    Corvo::TextMetrics MeasureText(std::string_view text, float size) override {
        return m_measures.MeasureText(text, size);
    }
    void Text(std::string_view, PointF, Corvo::TextAlign, float, Ink) override {}
    void Bitmap(const DrawingBitmap& bitmap, const RectF& r, std::uint8_t) override {
        auto& picture = m_pictures[{bitmap.pixels.data(), bitmap.width, bitmap.height}];
        if (!picture) picture = std::make_shared<Picture>(bitmap);
        m_calls.push_back([picture, r](cairo_t* c) {
            cairo_save(c);
            cairo_translate(c, r.x, r.y);
            cairo_scale(c, r.width / static_cast<float>(picture->bitmap.width),
                        r.height / static_cast<float>(picture->bitmap.height));
            cairo_set_source_surface(c, picture->surface.get(), 0.0, 0.0);
            cairo_paint(c);
            cairo_restore(c);
        });
    }
    void PushClip(const RectF& r) override {
        m_calls.push_back([r](cairo_t* c) {
            cairo_save(c);
            cairo_rectangle(c, r.x, r.y, r.width, r.height);
            cairo_clip(c);
        });
    }
    void PopClip() override { m_calls.push_back(cairo_restore); }

private:
    struct Picture {
        explicit Picture(const DrawingBitmap& from)
            : bitmap(from),
              surface(cairo_image_surface_create_for_data(
                          reinterpret_cast<unsigned char*>(bitmap.pixels.data()),
                          bitmap.opaque ? CAIRO_FORMAT_RGB24 : CAIRO_FORMAT_ARGB32, bitmap.width,
                          bitmap.height, 4 * bitmap.width),
                      cairo_surface_destroy) {}
        DrawingBitmap bitmap;
        std::shared_ptr<cairo_surface_t> surface;
    };

    void Add(Ink ink, std::function<void(cairo_t*)> call) {
        m_calls.push_back([ink, call = std::move(call)](cairo_t* c) {
            cairo_set_source_rgba(c, Corvo::RedOf(ink.colour) / 255.0, Corvo::GreenOf(ink.colour) / 255.0,
                                  Corvo::BlueOf(ink.colour) / 255.0, ink.opacity / 255.0);
            call(c);
        });
    }
    Corvo::DrawTarget& m_measures;
    std::vector<std::function<void(cairo_t*)>> m_calls;
    std::map<std::tuple<const void*, int, int>, std::shared_ptr<Picture>> m_pictures;
};

// A tone in noise, as long as the sound that the frames go through, seen at 16:9.
class Scene {
public:
    Scene(View view, int lines)
        : width(lines * 16 / 9),
          height(lines),
          m_view(view),
          m_sound(TestSupport::Noise<float>(kRefresh * 64, 0.05)) {
        const auto tone = TestSupport::Sine<float>(m_sound.size(), 441.0, kRate, 0.5);
        for (std::size_t i = 0; i < tone.size(); ++i) m_sound[i] += tone[i];
        kivspectrum::settings = {};
        kivspectrum::settings.view_option_e = view == kFilled ? 2 : view == kBars ? 3 : 1;
        kivspectrum::SetAnalysisWindowsOverlap(0.9f);
        analyser.set_parameters(kRate);
        analyser.SetOn(true);
        analyser.SetTunerOn(true);
        analyser.ShowSonogram(true);
        analyser.ObserverUpdate();
        for (int i = 0; i < 30; ++i) Hear();
    }
    ~Scene() { kivspectrum::settings = {}; }
    Scene(const Scene&) = delete;
    Scene& operator=(const Scene&) = delete;

    void Hear() {
        analyser.Feed(m_sound.data() + m_position, kRefresh, 1, 1);
        m_position = (m_position + kRefresh) % m_sound.size();
        analyser.Refresh();
    }
    void Draw(Corvo::DrawTarget& target) {
        const auto wide = static_cast<float>(width), high = static_cast<float>(height);
        const RectF whole{0.0f, 0.0f, wide, high};
        if (m_view <= kBars) return Corvo::DrawSpectrum(analyser, target, whole);
        if (m_view == kSonogram) return Corvo::DrawSonogram(analyser, target, whole);
        if (m_view == kTuner) return Corvo::DrawTuner(analyser, target, whole);
        const float left = wide * 5.0f / 8.0f, top = high * 5.0f / 12.0f;
        Corvo::DrawSpectrum(analyser, target, {0.0f, 0.0f, left, top});
        Corvo::DrawTuner(analyser, target, {left, 0.0f, wide - left, top});
        Corvo::DrawSonogram(analyser, target, {0.0f, top, wide, high - top});
    }
    // Long enough for a sonogram from edge to edge, and for the back-end to have its texts.
    void Warm(DrawingCairo& drawing, cairo_t* context) {
        for (int i = 0; i <= width; ++i) {
            if (i == 0 || i == width) {
                DrawingCairo::DrawTarget target(drawing, context, 96.0f);
                Draw(target);
            }
            Hear();
        }
    }
    const int width, height;
    kivspectrum analyser;

private:
    View m_view;
    std::vector<float> m_sound;
    std::size_t m_position = 0;
};

// A turn of the measurement is so many frames: some hold much more to draw than others.
constexpr int kFrames = 16;

void Finish(benchmark::State& state, View view) {
    state.SetLabel(kViews[view]);
    const auto frames = state.iterations() * kFrames;
    state.SetItemsProcessed(frames);
    state.counters["core_%"] = benchmark::Counter(static_cast<double>(frames) / (30.0 * 100.0),
                                                  benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
}

void BM_Frame(benchmark::State& state) {
    const auto view = static_cast<View>(state.range(0));
    Scene scene(view, static_cast<int>(state.range(1)));
    Surface surface(scene.width, scene.height);
    DrawingCairo drawing;
    scene.Warm(drawing, surface.context);
    for (auto _ : state)
        for (int frame = 0; frame < kFrames; ++frame) {
            scene.Hear();
            DrawingCairo::DrawTarget target(drawing, surface.context, 96.0f);
            scene.Draw(target);
            benchmark::ClobberMemory();
        }
    Finish(state, view);
}

void BM_BareFrame(benchmark::State& state) {
    const auto view = static_cast<View>(state.range(0));
    Scene scene(view, static_cast<int>(state.range(1)));
    Surface surface(scene.width, scene.height);
    DrawingCairo drawing;
    scene.Warm(drawing, surface.context);
    DrawingCairo::DrawTarget target(drawing, surface.context, 96.0f);
    Recorder recorder(target);
    for (int frame = 0; frame < kFrames; ++frame) {
        scene.Hear();
        scene.Draw(recorder);
    }
    for (auto _ : state) {
        recorder.Replay(surface.context);
        benchmark::ClobberMemory();
    }
    Finish(state, view);
}

void Cases(benchmark::internal::Benchmark* benchmark) {
    for (const int height : {720, 1080})
        for (int view = kSpectrum; view <= kAll; ++view) benchmark->Args({view, height});
}
BENCHMARK(BM_Frame)->Apply(Cases);
BENCHMARK(BM_BareFrame)->Apply(Cases);

void BM_FrameAnalysis(benchmark::State& state) {
    Scene scene(kAll, static_cast<int>(state.range(0)));
    Surface surface(scene.width, scene.height);
    DrawingCairo drawing;
    scene.Warm(drawing, surface.context);
    for (auto _ : state)
        for (int frame = 0; frame < kFrames; ++frame) scene.Hear();
    Finish(state, kAll);
}
BENCHMARK(BM_FrameAnalysis)->Arg(720)->Arg(1080);

}  // namespace
