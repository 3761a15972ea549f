#include "Analysis.h"

#include <pybind11/stl.h>

#include <cmath>
#include <memory>
#include <mutex>
#include <vector>

#include "Arrays.h"
#include "C/AnalyserHandle.h"
#include "Handle.h"
#include "Interrupt.h"
#include "Spectrum/Drawer/SpectrumDrawer.h"
#include "Spectrum/Drawer/VectorInterpolationFilterFloat.h"
#include "Spectrum/Scales/SpectrumScales.h"
#include "Spectrum/Sonogram/Sonogram.h"
#include "Spectrum/Tuner/Tuner.h"
#include "Spectrum/kivspectrum.h"
#ifdef DSP_PYTHON_DRAWS
#include "C/dspdrawing.h"
#endif

namespace python {
namespace {

constexpr int kMostChannels = 64, kRefreshesPerSecond = 30;
// A new spectrum at every refresh, from 5 kHz on.
constexpr float kDisplayOverlap = 0.98f;

struct Window {
    int type, length;
    float overlap;
};

// An analyser with settings of its own. The library keeps one set of settings for all: so one analysis runs
// at a time in a process, and what was set before is set again afterwards.
class Session {
public:
    Session(int rate, const Window& window)
        : m_guard(Lock()),
          m_before(kivspectrum::GetSettings()),
          m_speedBefore(Corvo::Sonogram::GetSpeedIndex()),
          m_handle(Made<dsp_analyser>([rate](dsp_analyser** handle, dsp_error* error) {
              return dsp_analyser_create(rate, handle, error);
          })) {
        Check(Corvo::C::AnalyserBehind(m_handle.get(), m_analyser));
        auto& settings = kivspectrum::settings;
        settings = {};
        settings.window_type = window.type;
        settings.window_length = window.length;
        settings.time_smoothing = 0;
        settings.peak_hold_mode = 2;
        settings.view_option_e = static_cast<std::int32_t>(Corvo::CurveStyle::Filled);
        kivspectrum::SetAnalysisWindowsOverlap(window.overlap);
        m_analyser->ObserverUpdate();
    }
    ~Session() {
        m_handle.reset();
        kivspectrum::settings = m_before;
        Corvo::Sonogram::SetSpeedIndex(m_speedBefore);
    }
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;

    kivspectrum& Analyser() { return *m_analyser; }
    dsp_analyser* Handle() { return m_handle.get(); }

private:
    static std::mutex& Lock() {
        static std::mutex lock;
        return lock;
    }

    std::lock_guard<std::mutex> m_guard;
    Corvo::SpectrumSettings m_before;
    int m_speedBefore;
    Owned<dsp_analyser> m_handle;
    kivspectrum* m_analyser = nullptr;
};

// The array's frames as interleaved blocks, followed by silence.
template <typename Sample>
class Player {
public:
    Player(Strided<const Sample> from, const Shape& shape) : m_from(from), m_shape(shape) {}

    void Feed(kivspectrum& analyser, int frames) {
        const auto channels = m_shape.channels;
        m_block.assign(static_cast<std::size_t>(frames * channels), Sample{});
        const auto given = std::min<py::ssize_t>(frames, m_shape.frames - m_fed);
        if (given > 0) Gather(m_from, m_fed, given, channels, m_block.data());
        analyser.Feed(m_block.data(), frames, static_cast<int>(channels), static_cast<int>(channels));
        m_fed += frames;
        m_interrupt.Check();
    }
    py::ssize_t Fed() const { return m_fed; }
    py::ssize_t Left() const { return m_shape.frames - m_fed; }

private:
    Strided<const Sample> m_from;
    Shape m_shape;
    py::ssize_t m_fed = 0;
    Interrupt m_interrupt;
    std::vector<Sample> m_block;
};

// call(player), without the interpreter's lock, for an array of either type.
template <typename Call>
void WithPlayer(const py::array& x, int axis, Call call) {
    ByType(x, [&](auto sample) {
        const Shape shape = ShapeOf(x, axis, kMostChannels);
        py::array keep;
        Player<decltype(sample)> player(View<decltype(sample)>(x, shape, keep), shape);
        const py::gil_scoped_release released;
        call(player);
    });
}

struct Spectra {
    std::vector<double> mean;
    std::vector<float> all;  // window after window
    py::ssize_t windows = 0;
};

// All whole windows; what is shorter than one is followed by silence.
template <typename Player>
Spectra Analyse(kivspectrum& analyser, Player& player, bool keepAll) {
    Spectra spectra;
    spectra.mean.resize(analyser.GetPower().size());
    if (keepAll)
        spectra.all.reserve(spectra.mean.size() *
                            static_cast<std::size_t>(1 + player.Left() / kivspectrum::settings.hop_length));
    for (int wanted = kivspectrum::settings.window_length; spectra.windows == 0 || player.Left() >= wanted;
         wanted = kivspectrum::settings.hop_length) {
        player.Feed(analyser, wanted);
        analyser.PrepareFFTForDrawingHelper(false, false);
        analyser.GetSpectrumDrawer()->AgePeaks();
        const auto& power = analyser.GetPower();
        for (std::size_t k = 0; k < power.size(); ++k) spectra.mean[k] += static_cast<double>(power[k]);
        if (keepAll) spectra.all.insert(spectra.all.end(), power.begin(), power.end());
        ++spectra.windows;
    }
    for (double& power : spectra.mean) power /= static_cast<double>(spectra.windows);
    return spectra;
}

// Powers below a full-scale sine's.
template <typename Values>
py::array_t<float> Shares(const Values& powers, double full) {
    py::array_t<float> shares(static_cast<py::ssize_t>(powers.size()));
    for (std::size_t k = 0; k < powers.size(); ++k)
        shares.mutable_at(static_cast<py::ssize_t>(k)) =
            static_cast<float>(static_cast<double>(powers[k]) / full);
    return shares;
}

// As an array of (windows, bins) that takes the memory over: a long recording's windows are a large part of
// it.
py::array_t<float> AllShares(Spectra& spectra, double full) {
    for (float& power : spectra.all) power = static_cast<float>(static_cast<double>(power) / full);
    auto kept = std::make_unique<std::vector<float>>(std::move(spectra.all));
    const auto bins = static_cast<py::ssize_t>(spectra.mean.size());
    float* const values = kept->data();
    const py::capsule owner(kept.release(), [](void* all) { delete static_cast<std::vector<float>*>(all); });
    return py::array_t<float>({spectra.windows, bins}, values, owner);
}

// (mean, peaks, all or None), each as powers relative to a full-scale sine's; all is (windows, bins).
py::tuple SpectraOf(const py::array& x, int rate, int type, int length, float overlap, bool keepAll,
                    int axis) {
    Spectra spectra;
    std::vector<float> peaks;
    double full = 1.0;
    WithPlayer(x, axis, [&](auto& player) {
        Session session(rate, {type, length, overlap});
        spectra = Analyse(session.Analyser(), player, keepAll);
        peaks = session.Analyser().GetSpectrumDrawer()->GetPeaks();
        full = Corvo::FullScalePower(kivspectrum::GetSettings());
    });
    py::object all = py::none();
    if (keepAll) all = AllShares(spectra, full);
    return py::make_tuple(Shares(spectra.mean, full), Shares(peaks, full), all);
}

// As low a note is heard at every rate as with the shortest window at 48 kHz.
Window TunerWindow(int rate) {
    Window window{4, 8192, kDisplayOverlap};
    while (window.length < 524288 && window.length * std::int64_t{48000} < std::int64_t{8192} * rate)
        window.length *= 2;
    return window;
}

// Feeds what falls between two refreshes of a display, then calls refresh(seconds), the time that the middle
// of the newest window stands at. Half a window of silence follows.
template <typename Player, typename Refresh>
void PlayThrough(kivspectrum& analyser, Player& player, int rate, Refresh refresh) {
    const int half = kivspectrum::settings.window_length / 2;
    for (std::int64_t count = 1; player.Left() > -half; ++count) {
        player.Feed(analyser, static_cast<int>(count * rate / kRefreshesPerSecond - player.Fed()));
        analyser.Refresh();
        if (player.Fed() >= half) refresh(static_cast<double>(player.Fed() - half) / rate);
    }
}

// At each refresh: seconds, Hz, cents, note (-1 for none), octave.
std::vector<std::tuple<double, double, float, int, int>> NotesOf(const py::array& x, int rate, int axis) {
    std::vector<std::tuple<double, double, float, int, int>> notes;
    WithPlayer(x, axis, [&](auto& player) {
        Session session(rate, TunerWindow(rate));
        const Tuner& tuner = *session.Analyser().GetTuner();
        session.Analyser().SetTunerOn(true);
        PlayThrough(session.Analyser(), player, rate, [&](double seconds) {
            const bool sounds = tuner.IsTuned() && tuner.GetHeardFrequency() > 0.0;
            notes.emplace_back(seconds, tuner.GetFrequency(), tuner.GetErrorCents(),
                               sounds ? tuner.GetNote() : -1, tuner.GetOctave());
        });
    });
    return notes;
}

#ifdef DSP_PYTHON_DRAWS
class Picture {
public:
    Picture(int width, int height, float dpi) : m_width(width), m_height(height), m_dpi(dpi) {
        if (width < 1 || height < 1 || width > 16384 || height > 16384)
            throw std::invalid_argument("a picture's sides can be 1 to 16384 pixels");
        m_pixels.resize(static_cast<std::size_t>(width) * static_cast<std::size_t>(height));
    }
    void Draw(dsp_analyser* analyser, int view) {
        // Kept for all pictures: laying out texts anew would take most of the time. Only in a Session.
        static dsp_drawing* const drawing = Made<dsp_drawing>([](dsp_drawing** handle, dsp_error* error) {
                                                return dsp_drawing_create(handle, error);
                                            }).release();
        const dsp_picture picture{sizeof(dsp_picture), m_width, m_height, 4 * m_width,
                                  m_pixels.data(),     m_dpi,   0.0f};
        Explained([&](dsp_error* error) { return dsp_draw(drawing, analyser, view, &picture, error); });
    }
    py::array_t<std::uint32_t> Pixels() const {
        return py::array_t<std::uint32_t>({m_height, m_width}, m_pixels.data());
    }

private:
    int m_width, m_height;
    float m_dpi;
    std::vector<std::uint32_t> m_pixels;
};

// From what SpectraOf found: the mean, over the highest levels as a thin line.
py::array DrawSpectrum(const std::vector<float>& mean, const std::vector<float>& peaks, int rate, int type,
                       int length, int width, int height, float dpi) {
    Picture picture(width, height, dpi);
    {
        const py::gil_scoped_release released;
        Session session(rate, {type, length, 0.0f});
        SpectrumDrawer& drawer = *session.Analyser().GetSpectrumDrawer();
        drawer.UpdateSettings(kivspectrum::settings);
        drawer.UpdateSamplingFrequency(rate);
        drawer.Allocate();
        const double full = Corvo::FullScalePower(kivspectrum::GetSettings());
        VectorInterpolationFilterFloat unused;
        for (const auto* shares : {&peaks, &mean}) {
            std::vector<float> powers(shares->size());
            for (std::size_t k = 0; k < powers.size(); ++k)
                powers[k] = static_cast<float>(static_cast<double>((*shares)[k]) * full);
            drawer.SmoothFftSpectrum(powers, 0.0f, unused);
            drawer.AgePeaks();
        }
        picture.Draw(session.Handle(), DSP_VIEW_SPECTRUM);
    }
    return picture.Pixels();
}

// At the fastest speed at which the whole recording fits, and only as wide as it is then.
py::array DrawSonogram(const py::array& x, int rate, int type, int length, bool pitch, int width, int height,
                       float dpi, int axis) {
    constexpr int kFastest = 8, kLeastColumns = 480;
    auto picture = std::make_unique<Picture>(width, height, dpi);
    WithPlayer(x, axis, [&](auto& player) {
        Session session(rate, pitch ? TunerWindow(rate) : Window{type, length, kDisplayOverlap});
        auto& analyser = session.Analyser();
        auto& sonogram = *analyser.GetSonogram();
        analyser.SetTunerOn(pitch);
        analyser.ShowSonogram(true);
        picture->Draw(session.Handle(), DSP_VIEW_SONOGRAM);  // makes the sonogram as wide as it can be
        const int columns = sonogram.GetBitmap().width;
        const double seconds = static_cast<double>(player.Left()) / rate;
        int speed = kFastest + 1;
        double needed = 0.0;
        do {
            Corvo::Sonogram::SetSpeedIndex(--speed);
            needed = std::ceil(seconds * Corvo::Sonogram::GetColumnsPerSecond());
        } while (speed > 0 && needed > columns);
        const int spare =
            std::max(columns - static_cast<int>(std::clamp(needed, 1.0 * kLeastColumns, 1e6)), 0);
        picture = std::make_unique<Picture>(width - spare, height, dpi);
        picture->Draw(session.Handle(), DSP_VIEW_SONOGRAM);
        PlayThrough(analyser, player, rate, [&](double now) {
            sonogram.SetTimeAtRightEdge(now);
            analyser.GetSpectrumDrawer()->AgePeaks();  // as drawing every refresh would
        });
        picture->Draw(session.Handle(), DSP_VIEW_SONOGRAM);
    });
    return picture->Pixels();
}

// The tuner's panel as it is when the array has been heard.
py::array DrawTuner(const py::array& x, int rate, int width, int height, float dpi) {
    Picture picture(width, height, dpi);
    WithPlayer(x, 0, [&](auto& player) {
        Session session(rate, TunerWindow(rate));
        session.Analyser().SetTunerOn(true);
        for (std::int64_t count = 1; player.Left() > 0; ++count) {
            player.Feed(session.Analyser(),
                        static_cast<int>(std::min<std::int64_t>(
                            count * rate / kRefreshesPerSecond - player.Fed(), player.Left())));
            session.Analyser().Refresh();
        }
        picture.Draw(session.Handle(), DSP_VIEW_TUNER);
    });
    return picture.Pixels();
}
#endif

}  // namespace

void DefineAnalysis(py::module_& module) {
    module.def("spectra", SpectraOf);
    module.def("notes", NotesOf);
    module.def("note_name",
               [](int note) { return Text([note](auto... out) { return dsp_note_name(note, out...); }); });
#ifdef DSP_PYTHON_DRAWS
    module.def("draw_spectrum", DrawSpectrum);
    module.def("draw_sonogram", DrawSonogram);
    module.def("draw_tuner", DrawTuner);
#endif
}

}  // namespace python
