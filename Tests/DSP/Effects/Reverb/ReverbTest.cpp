#include "DSP/Effects/Reverb/Reverb.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <numeric>

#include "Plain/PlainReverb.h"
#include "Platform/DenormalGuard.h"
#include "Support/EffectRun.h"

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

using Props = ReverbPrivate::_transform_props;

// 2 s, all wet at 0 dB, no damping, input filter off, reflections at once; changed by each test.
constexpr Props kBare{.preDelay = {0, 0},
                      .mix = {0, 0},
                      .length = {2000, 2000},
                      .wet = {0, 0},
                      .dry = {-450, -450},
                      .damping = {0, 0},
                      .reflections = {0, 0},
                      .room = {1000, 1000},
                      .reserved = 0,
                      .filterOff = 1};

void Load(Reverb& reverb, const Props& settings) {
    std::vector<std::uint8_t> chunk(4 + sizeof settings);
    std::memcpy(chunk.data() + 4, &settings, sizeof settings);
    reverb.SetSettingsChunk(chunk);
}

Props Settings(Reverb& reverb) {
    Props settings;
    std::memcpy(&settings, Chunk(reverb).data() + 4, sizeof settings);
    return settings;
}

// What comes out of one channel after a sample of 1.
std::vector<double> Impulse(const Props& settings, std::size_t frames, int rate = 48000) {
    Reverb reverb;
    Load(reverb, settings);
    std::vector<double> samples(frames);
    samples[0] = 1.0;
    return Render(reverb, samples, Format<double>(1, rate), {512});
}

// The energy that is still to come, in dB of the whole.
std::vector<double> DecayCurve(std::vector<double> energy) {
    std::partial_sum(energy.rbegin(), energy.rend(), energy.rbegin());
    const double whole = energy[0];
    for (auto& e : energy) e = 10.0 * std::log10(e / whole);
    return energy;
}

// Seconds for 60 dB, from the way between -5 and -35 dB.
double ReverberationTime(const std::vector<double>& curve, int rate) {
    const auto reaches = [&](double level) {
        return std::ranges::find_if(curve, [=](double dB) { return dB < level; }) - curve.begin();
    };
    return 2.0 * static_cast<double>(reaches(-35.0) - reaches(-5.0)) / rate;
}

std::string Text(Reverb& reverb, int index, double value) {
    const auto wide = reverb.GetParameterFormattedText(index, value);
    return {wide.begin(), wide.end()};
}

}  // namespace

// Catches lanes mixed up, pieces that run over a ring's end or read what they wrote, and a wrong cut.
template <typename T>
void ExpectThePlainReverb(int channels, int rate, const Props& settings, const std::string& what) {
    constexpr int kFrames = 6001;
    Reverb reverb;
    Load(reverb, settings);
    auto expected = Noise<T>(static_cast<std::size_t>(channels * kFrames));
    const auto output = Render(reverb, expected, Format<T>(channels, rate), {512, 3, 61});
    const Corvo::DenormalGuard guard;
    const ReverbDesign design(settings, rate);
    for (int c = 0; c < channels; ++c)
        Plain::Reverb<T>(design, static_cast<std::size_t>(c), rate)
            .Run(expected.data() + c, kFrames, channels);
    ASSERT_EQ(output, expected) << what << ", " << channels << " channels at " << rate;
}

TEST(Reverb, HasTheBitsOfThePlainOne) {
    const auto change = [](Props props, auto edit) {
        edit(props);
        return props;
    };
    Reverb preset;
    std::vector<std::pair<std::string, Props>> cases;
    for (const int i : {0, 7, 12, 16}) {
        preset.SetPreset(i);
        cases.emplace_back(preset.GetPresetName(i), Settings(preset));
    }
    cases.emplace_back("smallest room", change(cases[0].second, [](Props& p) { p.room = {1, 2}; }));
    cases.emplace_back("taps closer than a piece", change(cases[0].second, [](Props& p) {
                           p.preDelay = {1, 0};
                           p.reflections = {3, 90};
                       }));
    cases.emplace_back("no reflections, no filter", kBare);
    for (const auto& [what, settings] : cases)
        for (const int channels : {1, 2})
            for (const int rate : {48000, 8000}) {
                ExpectThePlainReverb<float>(channels, rate, settings, what);
                ExpectThePlainReverb<double>(channels, rate, settings, what);
            }
}

// Catches a reflection that is late, lost or too loud, and a mix that lets the tail through.
TEST(Reverb, PlaysTheReflectionsAloneAtFullMix) {
    auto settings = kBare;
    settings.preDelay = {100, 0};  // 10 ms
    settings.mix = {2000, 2000};
    settings.reflections = {1000, 0};
    const auto samples = Impulse(settings, 48000);
    // The tail would start with the shortest comb, 0.05 s and 4 samples after the first reflection; the
    // pattern is longer, so nothing waits.
    const std::pair<double, double> some[] = {{0.0, 0.85}, {0.0043, 0.841}, {0.0458, 0.289}, {0.0797, 0.134}};
    for (const auto& [seconds, gain] : some)
        EXPECT_NEAR(samples[static_cast<std::size_t>(seconds * 48000.0) + 480], gain, 1e-12) << seconds;
    EXPECT_NEAR(std::accumulate(samples.begin(), samples.end(), 0.0), 6.115, 1e-9);
    EXPECT_EQ(samples[479], 0.0);
    for (std::size_t i = 480 + 3826; i < samples.size(); ++i) ASSERT_EQ(samples[i], 0.0) << i;
}

// Catches a tail that starts before the last reflection, in either direction of the alignment.
TEST(Reverb, StartsTheTailWithTheLastReflectionOrLater) {
    for (const int size : {100, 600, 700, 3000}) {
        auto settings = kBare;
        settings.reflections = {size, size};
        settings.preDelay = {100, 100};  // a tap at 0 would come a sample late
        const auto tail = Impulse(settings, 48000);
        settings.mix = {2000, 2000};
        const auto reflections = Impulse(settings, 48000);
        const auto sounds = [](double sample) { return std::abs(sample) > 1e-12; };
        const auto last = std::find_if(reflections.rbegin(), reflections.rend(), sounds);
        EXPECT_EQ(std::ranges::find_if(tail, sounds) - tail.begin(), reflections.rend() - last - 1) << size;
    }
}

// Catches wrong comb lengths and gains: the decay against that of the combs as they are meant, undamped.
TEST(Reverb, DecaysLikeItsCombs) {
    for (const auto& [length, room] : {std::pair{2000, 1000}, {5000, 2500}, {700, 400}}) {
        auto settings = kBare;
        settings.length = {length, length};
        settings.room = {room, room};
        constexpr int kRate = 48000;
        auto heard = Impulse(settings, static_cast<std::size_t>(kRate * 8));
        std::vector<double> meant(heard.size());
        const double ratio = 1.0 - 366.0 / length;
        for (const double seconds : {0.05, 0.056, 0.061, 0.068, 0.072, 0.078}) {
            const double passSeconds = seconds * room * 0.001;
            double energy = 1.0;
            for (double at = passSeconds; at * kRate < static_cast<double>(meant.size()); at += passSeconds) {
                meant[static_cast<std::size_t>(at * kRate)] += energy;
                energy *= ratio * ratio;
            }
        }
        for (auto& sample : heard) sample *= sample;
        const double expected = ReverberationTime(DecayCurve(meant), kRate);
        EXPECT_NEAR(ReverberationTime(DecayCurve(heard), kRate), expected, 0.1 * expected) << length;
    }
}

// Catches a loop gain above 1 at 0 Hz and an input filter that lets an offset through.
TEST(Reverb, DoesNotGatherAnOffsetInTenMinutes) {
    Reverb reverb;
    reverb.SetPreset(2);
    const auto format = Format<float>(1, 8000);
    reverb.InitProcessing(8000, &format);
    double mean = 0.0;
    for (int second = 0; second < 600; ++second) {
        auto block = Noise<float>(8000, 0.1, static_cast<std::uint64_t>(second + 1));
        for (auto& sample : block) sample += 0.5f;
        ProcessBlock(reverb, block.data(), 8000, format);
        mean = std::accumulate(block.begin(), block.end(), 0.0) / 8000.0;
    }
    EXPECT_LT(std::abs(mean), 0.01);
}

// Catches words wired to the wrong side, and the two rules about sides.
TEST(Reverb, KeepsItsSidesApart) {
    const auto differs = [](auto edit) {
        Reverb reverb;
        reverb.SetPreset(13);  // the same on both sides
        auto settings = Settings(reverb);
        edit(settings);
        Load(reverb, settings);
        auto samples = Sine<double>(24000, 440.0, 48000, 0.5, 2);
        samples = Render(reverb, samples, Format<double>(), {512});
        for (std::size_t i = 0; i < samples.size(); i += 2)
            if (samples[i] != samples[i + 1]) return true;
        return false;
    };
    EXPECT_FALSE(differs([](Props&) {}));
    EXPECT_TRUE(differs([](Props& p) { p.preDelay[1] += 20; }));
    EXPECT_TRUE(differs([](Props& p) { p.mix[1] += 20; }));
    EXPECT_TRUE(differs([](Props& p) { p.length[1] += 20; }));
    EXPECT_TRUE(differs([](Props& p) { p.wet[1] += 20; }));
    EXPECT_TRUE(differs([](Props& p) { p.dry[1] += 20; }));
    EXPECT_TRUE(differs([](Props& p) { p.reflections[1] += 20; }));
    EXPECT_TRUE(differs([](Props& p) { p.room[1] += 20; }));
    EXPECT_FALSE(differs([](Props& p) { p.damping[1] += 500; })) << "the left damping serves both";
    EXPECT_FALSE(differs([](Props& p) { p.damping[0] += 500; })) << "the left damping serves both";
}

// Catches loops that explode: ratios and dampings from settings that no knob reaches.
TEST(Reverb, LimitsWhatWouldNotDecay) {
    for (const std::int32_t length : {0, -1000, -1, 2147483647}) {
        auto settings = kBare;
        settings.length = {length, length};
        settings.damping = {-100000, 0};
        const auto samples = Impulse(settings, 20000);
        EXPECT_TRUE(std::ranges::all_of(samples, [](double s) { return std::abs(s) <= 0.25; })) << length;
    }
    auto settings = kBare;
    settings.damping = {2500, 0};
    const ReverbDesign design(settings, 192000.0);
    EXPECT_TRUE(std::ranges::all_of(design.damping, [](double d) { return d == 0.999; }));
}

// Catches a wrong unit, step or order; what is shown is also what is parsed.
TEST(Reverb, ShowsAndReadsItsTextsBackwards) {
    struct Case {
        int external;
        const wchar_t* name;
        float value;
        const char* text;
    };
    constexpr Case kCases[] = {
        {15, L"Pre-delay", 0.5f, "100.0 ms"},     {13, L"Mix with early reflections", 0.3585f, "35.9 dB"},
        {11, L"Length", 0.2836f, "2836 ms"},      {9, L"Damping", 0.12f, "12.0 %"},
        {7, L"Early reflections", 0.2f, "1.00 "}, {5, L"Room size", 1.0f, "4.00 "},
        {3, L"Wet level", 0.0f, "-Inf. dB"},      {1, L"Dry level", 0.5f, "-17.5 dB"},
        {0, L"Dry level", 1.0f, "10.0 dB"},
    };
    Reverb reverb;
    for (const auto& c : kCases) {
        EXPECT_EQ(reverb.GetParamName(c.external), c.name);
        EXPECT_EQ(Text(reverb, c.external, c.value), c.text);
        const float read = reverb.GetParamValueNormalizedFromText(c.external, c.text);
        EXPECT_EQ(Text(reverb, c.external, read), c.text) << read;
    }
    reverb.SetParam(15, 1.0f, false);
    EXPECT_EQ(Settings(reverb).preDelay, (Props::Pair{2000, 2}));
    EXPECT_EQ(reverb.GetParam(15), 1.0f);
    EXPECT_EQ(reverb.GetPresetValues(16)[15], 903.0f / 2000.0f);
}
