#include "Measurements.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <complex>
#include <numbers>
#include <stdexcept>

#include "Chart.h"
#include "DSP/Effects/ParameterInput.h"
#include "PageText.h"

namespace docs {
namespace {

constexpr int kRate = 48000, kBlock = 512;

tWAVEFORMATEX Format(int rate, int bits) {
    tWAVEFORMATEX format{};
    format.nChannels = 2;
    format.nSamplesPerSec = static_cast<std::uint32_t>(rate);
    format.wBitsPerSample = static_cast<std::uint16_t>(bits);
    format.nBlockAlign = static_cast<std::uint16_t>(2 * bits / 8);
    format.nAvgBytesPerSec = format.nSamplesPerSec * format.nBlockAlign;
    return format;
}

void Set(CorvoEffectBase& effect, const std::string& name, const std::string& value) {
    if (name == "preset") {
        for (int i = 0; i < effect.NumPresets(); ++i)
            if (effect.GetPresetName(i) == value) return effect.SetPreset(i);
        throw std::invalid_argument(effect.GetName() + " has no preset " + value);
    }
    const auto indices = Corvo::DSP::FindParameters(effect, name);
    if (indices.empty()) throw std::invalid_argument(effect.GetName() + " has no parameter " + name);
    for (const int index : indices)
        effect.SetParam(index, Corvo::DSP::ReadParameter(effect, index, value).normalised, false);
}

using Stereo = std::vector<double>;  // interleaved

// The effect's answer to the same signal on both sides.
template <typename Signal>
Stereo Answer(CorvoEffectBase& effect, int frames, const Signal& signal) {
    const auto format = Format(kRate, 64);
    Stereo samples;
    for (int i = 0; i < frames; ++i) samples.insert(samples.end(), 2, signal(i));
    Corvo::DSP::ProcessFlags flags;
    for (int done = 0; done < frames; done += kBlock)
        effect.Process(samples.data() + 2 * done, std::min(kBlock, frames - done), &format, flags);
    return samples;
}

double Decibels(double amplitude) { return 20 * std::log10(std::max(amplitude, 1e-9)); }

struct Wanted {
    const EffectKind& kind;
    std::string argument;
    std::vector<std::pair<std::string, std::string>> curves;  // label, settings

    double Seconds() const { return std::stod(argument); }
};

// `points(effect)` are a curve for each set of settings.
template <typename Points>
std::vector<Curve> Curves(const Wanted& wanted, const Points& points) {
    std::vector<Curve> curves;
    for (const auto& [label, settings] : wanted.curves)
        curves.push_back({label, points(*Prepared(wanted.kind, settings, kRate))});
    return curves;
}

std::vector<double> Ticks(double from, double to, double step) {
    std::vector<double> ticks;
    for (int i = 0; from + i * step <= to + step / 1000; ++i) ticks.push_back(from + i * step);
    return ticks;
}

std::string DrawImpulse(const Wanted& wanted) {
    const int frames = static_cast<int>(wanted.Seconds() * kRate), bin = frames / 580;
    const auto curves = Curves(wanted, [&](CorvoEffectBase& effect) {
        const Stereo out = Answer(effect, frames, [](int i) { return i == 0 ? 1.0 : 0.0; });
        std::vector<std::pair<double, double>> points;
        for (int begin = 0; begin + bin <= frames; begin += bin) {
            double peak = 0;
            for (int i = begin; i < begin + bin; ++i)
                peak = std::max(peak, std::abs(out[static_cast<std::size_t>(2 * i)]));
            points.emplace_back(static_cast<double>(begin) / kRate, Decibels(peak));
        }
        return points;
    });
    return DrawChart(
        {"seconds after the impulse", 0, wanted.Seconds(), Ticks(0, wanted.Seconds(), wanted.Seconds() / 5)},
        {"level, dB", -90, 6, Ticks(-90, 0, 15)}, curves);
}

std::string DrawLevel(const Wanted& wanted) {
    const auto curves = Curves(wanted, [](CorvoEffectBase& effect) {
        std::vector<std::pair<double, double>> points;
        for (double level = -80; level <= 0; level += 1) {
            const double amplitude = std::pow(10, level / 20);
            points.emplace_back(
                level, Decibels(std::abs(Answer(effect, 4 * kRate, [&](int) { return amplitude; }).back())));
        }
        return points;
    });
    return DrawChart({"level in, dB", -80, 0, Ticks(-80, 0, 10)},
                     {"level out, dB", -80, 0, Ticks(-80, 0, 10)}, curves);
}

std::string DrawTransfer(const Wanted& wanted) {
    const auto curves = Curves(wanted, [](CorvoEffectBase& effect) {
        constexpr int kSteps = 200;
        const auto in = [](int i) { return 2.0 * i / kSteps - 1; };
        const Stereo out = Answer(effect, kSteps + 1, in);
        std::vector<std::pair<double, double>> points;
        for (int i = 0; i <= kSteps; ++i) points.emplace_back(in(i), out[static_cast<std::size_t>(2 * i)]);
        return points;
    });
    return DrawChart({"sample in", -1, 1, Ticks(-1, 1, 0.5)}, {"sample out", -1.1, 1.1, Ticks(-1, 1, 0.5)},
                     curves);
}

std::string DrawResponse(const Wanted& wanted) {
    const auto curves = Curves(wanted, [](CorvoEffectBase& effect) {
        const Stereo out = Answer(effect, kRate, [](int i) { return i == 0 ? 1.0 : 0.0; });
        std::vector<std::pair<double, double>> points;
        for (double hz = 20; hz <= 20000; hz *= 1.015) {
            const auto turn = std::polar(1.0, -2 * std::numbers::pi * hz / kRate);
            std::complex<double> sum = 0;
            for (std::size_t i = kRate; i-- > 0;) sum = sum * turn + out[2 * i];
            points.emplace_back(hz, Decibels(std::abs(sum)));
        }
        return points;
    });
    return DrawChart(
        {"frequency, Hz", 20, 20000, {20, 50, 100, 200, 500, 1000, 2000, 5000, 10000, 20000}, true},
        {"gain, dB", -36, 24, Ticks(-36, 24, 12)}, curves);
}

// The curves of both sides, or one where they are the same.
void AddSides(std::vector<Curve>& curves, const std::string& label,
              const std::vector<std::pair<double, double>>& left,
              const std::vector<std::pair<double, double>>& right) {
    const std::string prefix = label.empty() ? "" : label + ", ";
    if (left == right) return curves.push_back({label, left});
    curves.push_back({prefix + "left", left});
    curves.push_back({prefix + "right", right});
}

std::string DrawGain(const Wanted& wanted) {
    std::vector<Curve> curves;
    for (const auto& [label, settings] : wanted.curves) {
        const Stereo out = Answer(*Prepared(wanted.kind, settings, kRate),
                                  static_cast<int>(wanted.Seconds() * kRate), [](int) { return 1.0; });
        std::vector<std::pair<double, double>> left, right;
        for (std::size_t i = 0; i < out.size() / 2; i += 48) {
            left.emplace_back(static_cast<double>(i) / kRate, out[2 * i]);
            right.emplace_back(static_cast<double>(i) / kRate, out[2 * i + 1]);
        }
        AddSides(curves, label, left, right);
    }
    return DrawChart({"seconds", 0, wanted.Seconds(), Ticks(0, wanted.Seconds(), wanted.Seconds() / 5)},
                     {"gain", -1.1, 1.1, Ticks(-1, 1, 0.5)}, curves);
}

std::string DrawSweep(const Wanted& wanted) {
    std::vector<Curve> curves;
    Axis across{wanted.argument, 0, 1, {}};
    for (const auto& [label, settings] : wanted.curves) {
        const auto effect = Prepared(wanted.kind, settings, kRate);
        const int index = Corvo::DSP::FindParameters(*effect, wanted.argument).at(0);
        const auto at = [&](float n) { return std::stod(Corvo::DSP::TextAt(*effect, index, n)); };
        across.from = at(0.0f);
        across.to = at(1.0f);
        across.ticks = Ticks(across.from, across.to, (across.to - across.from) / 4);
        std::vector<std::pair<double, double>> left, right;
        for (int i = 0; i <= 200; ++i) {
            const float n = static_cast<float>(i) / 200;
            effect->SetParam(index, n, false);
            const Stereo out = Answer(*effect, 1, [](int) { return 1.0; });
            left.emplace_back(across.from + n * (across.to - across.from), Decibels(std::abs(out[0])));
            right.emplace_back(left.back().first, Decibels(std::abs(out[1])));
        }
        AddSides(curves, label, left, right);
    }
    return DrawChart(across, {"gain, dB", -30, 6, Ticks(-30, 6, 6)}, curves);
}

}  // namespace

std::unique_ptr<CorvoEffectBase> Prepared(const EffectKind& kind, std::string_view settings, int rate) {
    auto effect = kind.MakeReady();
    for (const auto& setting : Split(settings, ",")) {
        const auto parts = Split(setting, "=");
        if (parts.size() != 2) throw std::invalid_argument("not \"name=value\": " + setting);
        Set(*effect, parts[0], parts[1]);
    }
    const auto format = Format(rate, 64);
    effect->InitProcessing(kBlock, &format);
    return effect;
}

std::string DrawMeasurement(const EffectKind& kind, std::string_view text) {
    auto lines = Split(text, "\n");
    if (lines.size() < 2) throw std::invalid_argument("a chart needs its measure and a curve");
    const std::string first = lines[0], measure = first.substr(0, first.find(' '));
    Wanted wanted{kind, first.size() > measure.size() ? first.substr(measure.size() + 1) : "", {}};
    for (std::size_t i = 1; i < lines.size(); ++i) wanted.curves.push_back(NameAndRest(lines[i]));
    if (measure == "impulse") return DrawImpulse(wanted);
    if (measure == "level") return DrawLevel(wanted);
    if (measure == "transfer") return DrawTransfer(wanted);
    if (measure == "response") return DrawResponse(wanted);
    if (measure == "gain") return DrawGain(wanted);
    if (measure == "sweep") return DrawSweep(wanted);
    throw std::invalid_argument("no such measure: " + measure);
}

double NanosecondsPerFrame(const EffectKind& kind, std::string_view settings) {
    const auto effect = Prepared(kind, settings, kRate);
    const auto format = Format(kRate, 32);
    effect->InitProcessing(kBlock, &format);
    Corvo::DSP::ProcessFlags flags;
    return NanosecondsPerFrame(
        [&](float* samples, int frames) { effect->Process(samples, frames, &format, flags); });
}

double NanosecondsPerFrame(const std::function<void(float*, int)>& process) {
    using Clock = std::chrono::steady_clock;
    constexpr int kRounds = 120, kBlocks = 16;
    std::vector<float> noise(2 * kBlock * kBlocks);
    std::uint32_t state = 1;
    for (float& sample : noise) {
        state = state * 1664525u + 1013904223u;
        sample = static_cast<float>(state >> 8) / static_cast<float>(1 << 24) - 0.5f;
    }
    double fastest = 1e9;
    for (int round = 0; round < kRounds; ++round) {
        auto samples = noise;
        const auto begin = Clock::now();
        for (int block = 0; block < kBlocks; ++block) process(samples.data() + 2 * kBlock * block, kBlock);
        const std::chrono::duration<double, std::nano> taken = Clock::now() - begin;
        fastest = std::min(fastest, taken.count() / (kBlock * kBlocks));
    }
    return fastest;
}

}  // namespace docs
