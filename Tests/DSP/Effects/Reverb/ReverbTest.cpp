#include "DSP/Effects/Reverb/Reverb.h"

#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <numbers>

#include "Support/EffectRun.h"

using namespace Corvo::DSP;
using namespace TestSupport;

namespace {

// The places of the settings' words in the chunk, behind one that is none; all but the last have a left and a
// right one.
enum { kPreDelay = 1, kMix = 3, kLength = 5, kWet = 7, kDry = 9, kDamping = 11 };
enum { kReflections = 13, kRoom = 15, kFilterOff = 18 };
using Words = std::array<std::int32_t, 19>;
using Complex = std::complex<double>;

// What a frequency becomes on its way through one channel, from the meaning of the settings.
Complex Response(const Words& s, std::size_t side, double rate, double hz) {
    const auto after = [&](int samples) {
        return std::polar(1.0, -2.0 * std::numbers::pi * hz / rate * samples);
    };
    const auto gain = [](int tenths) { return tenths > -450 ? std::pow(10.0, tenths / 200.0) : 0.0; };
    constexpr double kTaps[][2] = {// seconds and gain
                                   {0, 0.85},       {0.0043, 0.841}, {0.0215, 0.504}, {0.0225, 0.491},
                                   {0.0268, 0.379}, {0.027, 0.38},   {0.0298, 0.346}, {0.0458, 0.289},
                                   {0.0485, 0.272}, {0.0572, 0.192}, {0.0587, 0.193}, {0.0595, 0.217},
                                   {0.0612, 0.181}, {0.0707, 0.18},  {0.0708, 0.181}, {0.0726, 0.176},
                                   {0.0741, 0.142}, {0.0753, 0.167}, {0.0797, 0.134}};
    constexpr struct {
        int base;
        double seconds, damping;
    } kCombs[] = {{4, 0.05, 0.46},   {7, 0.056, 0.48},  {15, 0.061, 0.5},
                  {29, 0.068, 0.52}, {31, 0.072, 0.53}, {34, 0.078, 0.55}};

    Complex input = 1.0;
    if (s[kFilterOff] == 0) {  // a Butterworth high-pass of second order at 10 Hz
        const Complex slope = (1.0 - after(1)) / (1.0 + after(1));
        const double corner = std::tan(std::numbers::pi * 10.0 / rate);
        input = slope * slope / (slope * slope + std::numbers::sqrt2 * corner * slope + corner * corner);
    }
    const double preDelay = s[kPreDelay + side] * 0.0001 * rate;
    Complex early = 0.0;
    int first = 0, last = 0;
    for (const auto& [seconds, level] : kTaps) {
        last = static_cast<int>(std::trunc(s[kReflections + side] * 0.001 * seconds * rate) + preDelay);
        if (seconds == 0.0) first = last;
        early += level * after(std::max(last, 1));
    }
    // A pass through a comb: as much of the last one's sum as the length leaves, of which damping keeps a
    // part for each of the samples that follow.
    const double kept = std::max(1e-5, 1.0 - 0.366 / (s[kLength + side] * 0.001));
    Complex combs = 0.0;
    int shortest = 1 << 30;
    for (const auto& comb : kCombs) {
        const int length = comb.base + static_cast<int>(0.001 * s[kRoom + side] * comb.seconds * rate);
        const double damping = std::min(s[kDamping] * comb.damping * rate * 2e-8, 0.999);  // left for both
        const Complex pass = after(length) / (1.0 - damping * after(1));
        combs += early * after(length) / (1.0 - (1.0 - damping) * kept * pass);
        shortest = std::min(shortest, length);
    }
    const Complex delayed = after(static_cast<int>(rate * 0.006));
    const Complex allPass = (0.7 + delayed) / (1.0 + 0.7 * delayed);
    Complex tail = combs * allPass;
    // The tail starts with the last reflection at the earliest.
    const int wait = last - first - shortest;
    (wait > 0 ? tail : early) *= after(std::abs(wait));
    const double mix = s[kMix + side] * 0.0005;
    return input *
           (gain(s[kDry + side]) + (tail * (1.0 - mix) * 0.16666667 + early * mix) * gain(s[kWet + side]));
}

// An impulse on every channel, until it has died away, against the closed form.
template <typename Sample>
void ExpectTheResponse(const Words& settings, int channels, int rate, const char* what) {
    const auto width = static_cast<std::size_t>(channels);
    const std::size_t frames = 4 * static_cast<std::size_t>(rate);
    std::vector<Sample> samples(width * frames);
    std::fill_n(samples.begin(), width, Sample(1));
    Reverb reverb;
    LoadWords(reverb, {settings.begin(), settings.end()});
    samples = Render(reverb, samples, Format<Sample>(channels, rate), {512, 3, 61});
    for (std::size_t side = 0; side < width; ++side)
        for (const double hz : {1.0, 9.0, 107.3, 1234.5, 3600.0}) {
            const auto heard = TransformAt(Channel(samples, side, width), hz / rate);
            const double tolerance = std::is_same_v<Sample, float> ? 2e-4 : 1e-6;
            EXPECT_LT(std::abs(heard - Response(settings, side, rate, hz)), tolerance)
                << what << ", side " << side << " of " << channels << " at " << rate << ", " << hz << " Hz";
        }
}

}  // namespace

// Catches a wrong constant, a reflection or comb that is late or lost, lanes mixed up, pieces that run over a
// ring's end, words wired to the wrong side, and a tail that starts before the last reflection.
TEST(Reverb, HasTheResponseOfItsDesign) {
    const struct {
        const char* what;
        Words settings;
    } cases[] = {
        // none, left and right pre-delay, mix, length, wet, dry, damping, reflections, room
        {"a hall", {0, 0, 2, 717, 600, 900, 800, -75, -60, -25, -35, 300, 900, 1786, 1584, 1049, 762}},
        {"sides", {0, 903, 316, 490, 158, 700, 600, 0, -225, -69, 0, 1200, 0, 254, 3055, 1123, 1900}},
        {"smallest room", {0, 0, 9, 0, 0, 600, 500, 0, 0, -450, 0, 0, 0, 469, 0, 1, 2, 0, 1}},
        {"taps close together", {0, 1, 0, 900, 400, 500, 600, 0, 0, -20, -450, 150, 0, 3, 90, 351, 351}},
        {"reflections alone", {0, 100, 0, 2000, 2000, 700, 500, 0, 10, -450, -450, 586, 0, 1000, 0, 1000, 1}},
        {"silent at -450 alone",
         {0, 100, 0, 1000, 0, 700, 500, -450, -449, -449, -450, 586, 0, 1000, 0, 1000, 1}},
    };
    for (const auto& [what, settings] : cases) {
        ExpectTheResponse<double>(settings, 2, 8000, what);
        ExpectTheResponse<float>(settings, 2, 11025, what);
        ExpectTheResponse<double>(settings, 1, 8000, what);
    }
    auto damped = cases[0].settings;
    damped[kDamping] = 2500;
    ExpectTheResponse<double>(damped, 1, 192000, "as damped as can be");
}

// Catches loops that explode: ratios and dampings from settings that no knob reaches.
TEST(Reverb, LimitsWhatWouldNotDecay) {
    for (const std::int32_t length : {0, -1000, -1, 2147483647}) {
        Reverb reverb;
        LoadWords(reverb, {0, 0, 0, 0, 0, length, length, 0, 0, -450, -450, -100000, 0, 0, 0, 1000, 1000});
        std::vector<double> samples(20000);
        samples[0] = 1.0;
        for (const double sample : Render(reverb, samples, Format<double>(1, 8000), {512}))
            ASSERT_LE(std::abs(sample), 0.25) << length;
    }
}
