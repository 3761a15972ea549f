#include "Adapter.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <fstream>
#include <iterator>
#include <numbers>
#include <sstream>

#include "Spectrum/Fft/CorvoFFT.h"
#include "Support/Signals.h"

// The adapter behind every plug-in, over all plug-ins of both widths. Bypass, latency, blocks of any length,
// samples that are no numbers and the rules of the audio thread are plugin_host's.
namespace {

using namespace Corvo::Plugins;
using Corvo::EffectParameterType;

constexpr int kRate = 48000;
constexpr int kLongest = 256;

struct Plugin {
    const PluginRow* row;
    int channels;
};
std::vector<Plugin> All() {
    std::vector<Plugin> all;
    for (const auto& row : PluginRows())
        for (const int channels : {1, 2}) all.push_back({&row, channels});
    return all;
}

class EveryPlugin : public testing::TestWithParam<Plugin> {
protected:
    std::unique_ptr<Adapter> Make() const {
        auto adapter = std::make_unique<Adapter>(*GetParam().row, GetParam().channels);
        adapter->Prepare(kRate, kLongest);
        return adapter;
    }
};
INSTANTIATE_TEST_SUITE_P(All, EveryPlugin, testing::ValuesIn(All()), [](const auto& plugin) {
    return SymbolOf(PluginName(*plugin.param.row, plugin.param.channels));
});

using Sound = std::vector<float>;

// Processes a sound, the same in every channel, in blocks of 64 frames; gives the first channel.
// before(frame) is called in front of every block.
template <typename Before>
Sound Processed(Adapter& adapter, const Sound& in, Before before) {
    Sound left(in), right(in);
    for (std::size_t done = 0; done < in.size(); done += 64) {
        before(done);
        float* const at[]{left.data() + done, right.data() + done};
        adapter.Run(at, at, nullptr, static_cast<int>(std::min<std::size_t>(64, in.size() - done)));
    }
    return left;
}

// Saved sessions know ports by place and symbol: a line may be added below the others of its plug-in, and
// none may change.
TEST(Ports, StandInTheListThatSavedSessionsKnow) {
    std::string now;
    for (const auto& [row, channels] : All()) {
        now += PluginUri(*row, channels) + "\n";
        for (const auto& port : LayoutOf(*row, channels).ports) now += "    " + port.symbol + "\n";
    }
    std::ifstream file(DSP_PORT_LIST);
    std::stringstream kept;
    kept << file.rdbuf();
    EXPECT_EQ(now, kept.str());
}

TEST_P(EveryPlugin, ShowsTheNumberThatAPortIsSetTo) {
    const auto adapter = Make();
    for (std::size_t i = 0; i < adapter->Ports().size(); ++i) {
        const Port& port = adapter->Ports()[i];
        for (int step = 0; step <= 20 && port.isNumber && !port.isOutput; ++step) {
            const float value = port.Value(static_cast<float>(step) / 20.0f);
            const std::string text = adapter->Text(static_cast<int>(i), value);
            float shown = 0.0f;
            if (text.find('|') != text.npos || !ReadNumber(text, shown) || !std::isfinite(shown)) continue;
            // One unit of the last decimal: some are cut. A ratio has no more than so many steps.
            const auto point = text.find('.'), end = text.find_last_of("0123456789");
            const double unit = point < end ? std::pow(0.1, end - point) : 1.0;
            EXPECT_NEAR(shown, value, text.ends_with(":1") ? 0.06 * value : 1.01 * unit)
                << port.name << " " << text;
        }
    }
}

TEST_P(EveryPlugin, TellsTheLatencyOfItsEffect) {
    const auto effect = GetParam().row->Make();
    const auto format = TestSupport::Format<float>(GetParam().channels);
    effect->InitProcessing(kLongest, &format);
    EXPECT_EQ(Make()->Latency(), effect->GetLatency());
}

TEST_P(EveryPlugin, StateOfEveryPresetIsExact) {
    const auto adapter = Make(), other = Make();
    for (int preset = -1; preset < adapter->Presets(); ++preset) {
        adapter->TakePreset(preset);
        const auto state = adapter->State();
        ASSERT_TRUE(other->TakeState(state));
        EXPECT_EQ(other->State(), state);
        // A host that sets the values that it read changes nothing.
        for (std::size_t i = 0; i < adapter->Ports().size() && !adapter->Ports()[i].isOutput; ++i) {
            const int port = static_cast<int>(i);
            other->Set(port, other->Value(port) * (1.0f + 2e-7f));
            EXPECT_EQ(adapter->Value(port), other->Value(port));
        }
        Processed(*other, Sound(kLongest), [](std::size_t) {});
        EXPECT_EQ(other->State(), state);
    }
}

TEST(Actions, AreOffAgainAndTheHostHearsOfIt) {
    Adapter adapter(*FindPluginRow("denoiser"), 1);
    adapter.Prepare(kRate, kLongest);
    const auto at = std::ranges::find(adapter.Ports(), true, &Port::springsBack) - adapter.Ports().begin();
    for (int press = 0; press < 2; ++press) {
        adapter.Set(static_cast<int>(at), 1.0f);
        Processed(adapter, Sound(64), [](std::size_t) {});
        EXPECT_EQ(adapter.Value(static_cast<int>(at)), 0.0f);
        EXPECT_TRUE(adapter.TakeOtherValues());
    }
}

TEST(SideChain, CountsOnceItSounds) {
    Adapter adapter(*FindPluginRow("compressor"), 1);
    adapter.Prepare(kRate, kLongest);
    const Sound quiet(kLongest), loud(kLongest, 0.9f), in = TestSupport::Sine<float>(kLongest, 440.0);
    const auto level = [&](const Sound* side) {
        float last = 0.0f;
        for (int block = 0; block < 200; ++block) {
            Sound out(in);
            float* const at[]{out.data()};
            const float* const beside[]{side ? side->data() : nullptr};
            adapter.Run(at, at, side ? beside : nullptr, kLongest);
            last = *std::ranges::max_element(out);
        }
        return last;
    };
    const float own = level(nullptr);
    EXPECT_EQ(level(&quiet), own);
    EXPECT_LT(level(&loud), 0.7f * own);
    EXPECT_GT(level(&quiet), 1.1f * own);
}

TEST(Results, TellTheNoteThatIsHeard) {
    Adapter adapter(*FindPluginRow("cantrix"), 1);
    adapter.Prepare(kRate, kLongest);
    const auto first = static_cast<int>(adapter.Ports().size()) - 5;
    const auto expect = [&](const std::vector<float>& values) {
        for (int i = 0; i < 5; ++i)
            EXPECT_NEAR(adapter.Value(first + i), values[static_cast<std::size_t>(i)], i < 2 ? 0.0f : 2.0f)
                << i;
    };
    expect({-1.0f, 0.0f, 0.0f, 0.0f, 0.0f});
    EXPECT_EQ(adapter.Text(first, adapter.Value(first)), "None");
    Processed(adapter, TestSupport::Sine<float>(kRate, 223.85), [](std::size_t) {});  // A3 and 30 cents
    expect({9.0f, 3.0f, 223.85f, 30.0f, -30.0f});
    EXPECT_EQ(adapter.Text(first, adapter.Value(first)), "A");
    adapter.Reset();
    EXPECT_EQ(adapter.Text(first, adapter.Value(first)), "None");
}

// What a tone of 2000 Hz becomes under automation at 50 Hz: energy further than 700 Hz from all its
// harmonics, where no side-band belongs, in dB of all of it. Steps of 64 frames lie there, 750 Hz and more
// from each.
double Zipper(const float* sound) {
    constexpr int kLength = 65536;
    std::vector<double> spectrum(kLength);
    for (int i = 0; i < kLength; ++i) {
        // Blackman-Harris: its side lobes are below what is looked for.
        const double phase = 2.0 * std::numbers::pi * i / kLength;
        spectrum[static_cast<std::size_t>(i)] =
            static_cast<double>(sound[i]) *
            (0.35875 - 0.48829 * std::cos(phase) + 0.14128 * std::cos(2.0 * phase) -
             0.01168 * std::cos(3.0 * phase));
    }
    CorvoFFT fft;
    fft.AllocateReal(kLength, 0);
    fft.DoFFTReal(spectrum.data(), 0, 0);
    double all = 1e-30, far = 1e-30;
    for (std::size_t bin = 1; bin < kLength / 2; ++bin) {
        const double power = std::norm(std::complex(spectrum[2 * bin], spectrum[2 * bin + 1]));
        const double hz = static_cast<double>(bin) * kRate / kLength;
        all += power;
        if (std::abs(hz - 2000.0 * std::round(hz / 2000.0)) > 700.0) far += power;
    }
    fft.Free();
    return 10.0 * std::log10(far / all);
}

// Ports that are louder than -60 dB: how loud they may be, and why.
struct Rough {
    const char *id, *port;
    double most;
    const char* why;
};
constexpr Rough kRough[]{
    {"tremolo", "out_gain", -50, "kept in tenths of a decibel, which are steps of their own"},
    {"echo", "out_gain", -50, "kept in tenths of a decibel"},
    {"echo", "delay", -50, "kept in tenths of a decibel"},
    {"reverb", "dry_level", -55, "kept in tenths of a decibel"},
    {"echo", "depth", -30, "another delay is another place in the sound: it jumps, as notes do"},
    {"chorus", "delay", -15, "the read head moves: a change of delay is a change of pitch"},
    {"chorus", "depth", -15, "the read head moves"},
    {"reverb", "early_reflections", -30, "the reflections move"},
    {"reverb", "pre_delay", -25, "the reflections move"},
    {"pitch-shift", "pitch", 0.1, "the tone itself moves"},
};

TEST_P(EveryPlugin, AutomationAtFiftyHertzMakesNoZipperNoise) {
    if (GetParam().channels == 1) GTEST_SKIP() << "as the left side of the other";
    const auto& layout = LayoutOf(*GetParam().row, GetParam().channels);
    for (std::size_t i = 0; i < layout.ports.size(); ++i) {
        const Port& port = layout.ports[i];
        if (port.type != EffectParameterType::Continuous || port.whole || port.isOutput) continue;
        const Sound in = TestSupport::Sine<float>(4 * kRate, 2000.0, kRate, 0.25);
        // Up and down by a twentieth of the knob, told every 64 frames, as hosts do.
        const auto zipper = [&](double depth) {
            const auto adapter = Make();
            const Sound out = Processed(*adapter, in, [&](std::size_t at) {
                const double phase = 2.0 * std::numbers::pi * 50.0 * static_cast<double>(at) / kRate;
                const auto position = static_cast<float>(0.6 + depth * std::sin(phase));
                adapter->Set(static_cast<int>(i), port.curve.Number(position));
            });
            return Zipper(&out[out.size() - 65536]);
        };
        const auto* const rough = std::ranges::find_if(kRough, [&](const Rough& known) {
            return GetParam().row->id == std::string_view(known.id) && port.symbol.starts_with(known.port);
        });
        // Some sound like that without automation, too.
        const double most = rough != std::end(kRough) ? rough->most : std::max(-60.0, zipper(0.0) + 3.0);
        EXPECT_LT(zipper(0.05), most) << port.symbol;
    }
}

}  // namespace
