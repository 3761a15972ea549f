#include "Adapter.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <fstream>
#include <iterator>
#include <limits>
#include <numbers>
#include <sstream>

#include "Support/AudioThreadRules.h"

// The adapter behind every plug-in, over all plug-ins of both widths.
namespace {

using namespace Corvo::Plugins;
using Corvo::EffectParameterType;

constexpr double kRate = 48000.0;
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
    std::unique_ptr<Adapter> Make(double rate = kRate) const {
        auto adapter = std::make_unique<Adapter>(*GetParam().row, GetParam().channels);
        adapter->Prepare(rate, kLongest);
        return adapter;
    }
    bool Is(std::string_view id) const { return id == GetParam().row->id; }
};
INSTANTIATE_TEST_SUITE_P(All, EveryPlugin, testing::ValuesIn(All()), [](const auto& plugin) {
    return SymbolOf(PluginName(*plugin.param.row, plugin.param.channels));
});

using Sound = std::vector<float>;

Sound Sine(double hz, std::size_t frames, double rate = kRate) {
    Sound sound(frames);
    for (std::size_t i = 0; i < frames; ++i)
        sound[i] =
            static_cast<float>(0.25 * std::sin(2.0 * std::numbers::pi * hz * static_cast<double>(i) / rate));
    return sound;
}

// Processes a sound, the same in every channel, in blocks of the lengths in turn; gives the first channel.
// before(frame) is called in front of every block.
template <typename Before>
Sound Processed(Adapter& adapter, const Sound& in, const std::vector<int>& lengths, Before before) {
    Sound left(in), right(in);
    std::size_t done = 0;
    for (std::size_t block = 0; done < in.size(); ++block) {
        before(done);
        const int frames = std::min(lengths[block % lengths.size()], static_cast<int>(in.size() - done));
        float* const at[]{left.data() + done, right.data() + done};
        adapter.Run(at, at, nullptr, frames);
        done += static_cast<std::size_t>(frames);
    }
    return left;
}
Sound Processed(Adapter& adapter, const Sound& in, const std::vector<int>& lengths = {64}) {
    return Processed(adapter, in, lengths, [](std::size_t) {});
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
        for (int step = 0; step <= 20; ++step) {
            const auto index = static_cast<int>(i);
            const float value = port.Value(static_cast<float>(step) / 20.0f);
            float back = std::numeric_limits<float>::quiet_NaN();
            const std::string text = adapter->Text(index, value);
            ASSERT_TRUE(adapter->FromText(index, text, back)) << port.name << " " << text;
            EXPECT_EQ(adapter->Text(index, back), text) << port.name;
            if (port.type != EffectParameterType::Continuous || text.find('|') != text.npos) continue;
            char* end = nullptr;
            const float shown = std::strtof(text.c_str(), &end);
            if (end == text.c_str() || port.unit == "%") continue;
            EXPECT_NEAR(shown, value, 1.01 * std::max(port.resolution, 0.01)) << port.name << " " << text;
        }
    }
}

TEST_P(EveryPlugin, StateIsExact) {
    const auto adapter = Make(), other = Make();
    for (int preset = -1; preset < adapter->Presets(); ++preset) {
        adapter->TakePreset(preset);
        const auto state = adapter->State();
        ASSERT_TRUE(other->TakeState(state));
        EXPECT_EQ(other->State(), state);
        // A host that sets the values that it read changes nothing.
        for (std::size_t i = 0; i < adapter->Ports().size(); ++i) {
            const int port = static_cast<int>(i);
            other->Set(port, other->Value(port) * (1.0f + 2e-7f));
            EXPECT_EQ(adapter->Value(port), other->Value(port));
        }
        Processed(*other, Sound(kLongest));
        EXPECT_EQ(other->State(), state);
    }
    // What is automated while it plays is in the state, arrived or on its way.
    for (std::size_t i = 0; i < adapter->Ports().size(); ++i)
        if (adapter->Ports()[i].type == EffectParameterType::Continuous)
            adapter->Set(static_cast<int>(i), adapter->Ports()[i].Value(0.7f));
    Processed(*adapter, Sound(64));
    const auto early = adapter->State();
    Processed(*adapter, Sound(static_cast<std::size_t>(kRate)));
    EXPECT_EQ(adapter->State(), early);
    ASSERT_TRUE(other->TakeState(early));
    for (std::size_t i = 0; i < adapter->Ports().size(); ++i) {
        const Port& port = adapter->Ports()[i];
        EXPECT_NEAR(other->Value(static_cast<int>(i)), adapter->Value(static_cast<int>(i)),
                    1.01 * port.resolution + 0.01 * (port.most - port.least))
            << port.name;
    }
    EXPECT_FALSE(other->TakeState({1, 2, 3}));
    EXPECT_EQ(other->State(), early);
}

TEST_P(EveryPlugin, TakesBlocksOfAnyLength) {
    if (!GetParam().row->realTime) GTEST_SKIP() << "its engine cuts the stream in its own way";
    const auto whole = Make(), cut = Make();
    const Sound in = Sine(440.0, 12000);
    const Sound expected = Processed(*whole, in, {kLongest});
    const Sound heard = Processed(*cut, in, {1, 0, 77, 4 * kLongest + 3, 64});
    for (std::size_t i = 0; i < in.size(); ++i) ASSERT_NEAR(heard[i], expected[i], 1e-5) << i;
}

TEST_P(EveryPlugin, BypassIsTheDelayedInputAndDoesNotClick) {
    const auto adapter = Make();
    const Sound in = Sine(100.0, 48000);
    const Sound out =
        Processed(*adapter, in, {64}, [&](std::size_t at) { adapter->Bypass(at >= 16000 && at < 32000); });
    const auto latency = static_cast<std::size_t>(adapter->Latency());
    for (std::size_t i = 16064 + 960; i < 32000; ++i) ASSERT_EQ(out[i], in[i - latency]) << i;
    // A step in the sound or in its slope stands out of the second differences.
    const auto roughest = [&out](std::size_t from, std::size_t to) {
        float most = 0.0f;
        for (std::size_t i = from; i < to; ++i)
            most = std::max(most, std::abs(out[i] - 2.0f * out[i - 1] + out[i - 2]));
        return most;
    };
    EXPECT_LT(roughest(16000, 17100), 2.0f * roughest(13000, 16000) + 0.002f);
}

TEST_P(EveryPlugin, TellsItsLatencyAtEveryRate) {
    for (const double rate : {44100.0, 48000.0, 96000.0, 192000.0}) {
        const auto adapter = Make(rate);
        const int latency = adapter->Latency();
        // Short tones with pauses: neither steady noise nor one pitch.
        const auto frames = static_cast<std::size_t>(rate);
        Sound in = Sine(220.0, frames, rate);
        for (std::size_t i = 0; i < frames; ++i) in[i] *= i % (frames / 5) < frames / 12 ? 1.0f : 0.0f;
        const Sound out = Processed(*adapter, in);
        EXPECT_EQ(adapter->Latency(), latency);
        if (latency == 0) continue;
        double best = 0.0;
        int lag = -1;
        for (int candidate = std::max(0, latency - 2000); candidate < latency + 2000; ++candidate) {
            double sum = 0.0;
            for (std::size_t i = static_cast<std::size_t>(candidate); i < frames; i += 3)
                sum += static_cast<double>(out[i] * in[i - static_cast<std::size_t>(candidate)]);
            if (sum > best) {
                best = sum;
                lag = candidate;
            }
        }
        // The engine that splices is exact on the whole, not to the frame.
        EXPECT_NEAR(lag, latency, GetParam().row->realTime ? 1 : 0.02 * rate) << rate;
    }
}

TEST_P(EveryPlugin, RecoversFromSamplesAndValuesThatAreNoNumbers) {
    const auto adapter = Make();
    Sound in = Sine(440.0, 96000);
    for (std::size_t i = 2000; i < 2100; ++i)
        in[i] = i % 2 ? std::numeric_limits<float>::quiet_NaN() : INFINITY;
    const Sound out = Processed(*adapter, in, {64}, [&](std::size_t at) {
        for (std::size_t i = 0; at == 4032 && i < adapter->Ports().size(); ++i)
            adapter->Set(static_cast<int>(i), std::numeric_limits<float>::quiet_NaN());
    });
    float loudest = 0.0f;
    for (std::size_t i = 0; i < out.size(); ++i) {
        ASSERT_TRUE(std::isfinite(out[i])) << i;
        if (i > 48000) loudest = std::max(loudest, std::abs(out[i]));
    }
    EXPECT_GT(loudest, 0.01f);
}

TEST_P(EveryPlugin, NeitherAllocatesNorWaitsWhileItRuns) {
    if (!TestSupport::AudioThreadRules::CanCount() || !GetParam().row->realTime) GTEST_SKIP();
    const auto adapter = Make();
    const Sound in = Sine(440.0, 512);
    for (const bool first : {true, false})
        for (std::size_t i = 0; i < adapter->Ports().size(); ++i) {
            Sound left(in), right(in);
            float* const at[]{left.data(), right.data()};
            const Port& port = adapter->Ports()[i];
            const TestSupport::AudioThreadRules rules;
            adapter->Set(static_cast<int>(i), first ? port.most : port.least);
            adapter->Bypass(i % 2 == 0);
            adapter->Run(at, at, at, 512);
            EXPECT_EQ(rules.Broken(), "") << port.name << (first ? " first" : "");
        }
}

TEST(SideChain, CountsOnceItSounds) {
    Adapter adapter(*FindPluginRow("compressor"), 2);
    adapter.Prepare(kRate, kLongest);
    const Sound quiet(kLongest), loud(kLongest, 0.9f), in = Sine(440.0, kLongest);
    const auto level = [&](const Sound* side) {
        float last = 0.0f;
        for (int block = 0; block < 200; ++block) {
            Sound left(in), right(in);
            float* const at[]{left.data(), right.data()};
            const float* const beside[]{side ? side->data() : nullptr, side ? side->data() : nullptr};
            adapter.Run(at, at, side ? beside : nullptr, kLongest);
            last = *std::ranges::max_element(left);
        }
        return last;
    };
    const float own = level(nullptr);
    EXPECT_EQ(level(&quiet), own);
    EXPECT_LT(level(&loud), 0.7f * own);
    EXPECT_GT(level(&quiet), 1.1f * own);
}

// Energy of a sound outside the multiples of 50 Hz around a tone that automation at 50 Hz is expected to
// make, in dB below all of it. One second of it.
double Zipper(const Sound& sound, double tone) {
    const auto power = [&sound](double hz) {
        std::complex<double> sum;
        const auto frames = static_cast<double>(sound.size());
        const std::complex<double> turn = std::polar(1.0, -2.0 * std::numbers::pi * hz / kRate);
        std::complex<double> phase = 1.0;
        for (std::size_t i = 0; i < sound.size(); ++i, phase *= turn)
            sum += static_cast<double>(sound[i]) * phase;
        return std::norm(sum / frames) * 2.0;
    };
    double all = 0.0, expected = 0.0;
    for (const float sample : sound) all += static_cast<double>(sample) * static_cast<double>(sample);
    all /= static_cast<double>(sound.size());
    for (int side = -12; side <= 12; ++side) expected += power(tone + 50.0 * side);
    return 10.0 * std::log10(std::max(all - expected, 1e-14 * all) / all);
}

// The loudest zipper noise of a plug-in's continuous ports in dB, where that is above -60, and why that is
// so.
struct Rough {
    const char *id, *port, *why;
};
constexpr Rough kRough[]{
    {"none", "", ""},
};

TEST_P(EveryPlugin, AutomationAtFiftyHertzMakesNoZipperNoise) {
    const auto layout = LayoutOf(*GetParam().row, GetParam().channels);
    for (std::size_t i = 0; i < layout.ports.size(); ++i) {
        const Port& port = layout.ports[i];
        if (port.type != EffectParameterType::Continuous || port.whole) continue;
        const auto adapter = Make();
        const Sound in = Sine(2000.0, 3 * 48000);
        // Up and down by a tenth of the knob, told every 64 frames, as hosts do.
        const Sound out = Processed(*adapter, in, {64}, [&](std::size_t at) {
            const double phase = 2.0 * std::numbers::pi * 50.0 * static_cast<double>(at) / kRate;
            adapter->Set(static_cast<int>(i),
                         port.curve.Number(static_cast<float>(0.6 + 0.05 * std::sin(phase))));
        });
        const double zipper = Zipper({out.end() - 48000, out.end()}, 2000.0);
        const bool known = std::ranges::any_of(
            kRough, [&](const Rough& rough) { return Is(rough.id) && port.symbol.starts_with(rough.port); });
        if (known) continue;
        EXPECT_LT(zipper, -60.0) << port.symbol;
    }
}

}  // namespace
