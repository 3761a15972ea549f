#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "C/dspdll.h"
#include "Plain/PlainParEQ.h"
#include "Platform/DenormalGuard.h"
#include "Support/Signals.h"

// What the kernels cost on any target, without a benchmark library: one line for each, a name and the
// nanoseconds a stereo frame takes (a transform: the whole). An argument keeps to the names that begin with
// it. Scripts/compare-targets.sh runs the builds in turn.
namespace {

constexpr int kFrames = 512, kRate = 48000;
std::string wanted;

void Check(dsp_status status, const char* what) {
    if (status == DSP_OK) return;
    std::fprintf(stderr, "kernel_times: %s: %s\n", what, dsp_status_text(status));
    std::exit(1);
}

// The fastest of many rounds of equal length: what else the machine does only makes a round slower. A round
// is long enough to hold many calls, as some kernels save their work up for one of several.
void Report(const std::string& name, double units, const std::function<void()>& once) {
    if (!name.starts_with(wanted)) return;
    using Clock = std::chrono::steady_clock;
    using Seconds = std::chrono::duration<double>;
    const auto round = [&](int calls) {
        const auto start = Clock::now();
        for (int i = 0; i < calls; ++i) once();
        return Seconds(Clock::now() - start).count() / calls;
    };
    constexpr double kRound = 2e-3, kAll = 0.2;
    round(50);
    const int calls = std::clamp(static_cast<int>(kRound / round(50)), 50, 100'000);
    double fastest = round(calls);
    for (const auto end = Clock::now() + Seconds(kAll); Clock::now() < end;)
        fastest = std::min(fastest, round(calls));
    std::printf("%s\t%.3f\n", name.c_str(), fastest * 1e9 / units);
    std::fflush(stdout);
}

struct Setting {
    const char *parameter, *text;
};

struct EffectRow {
    const char *name, *effect;
    std::vector<Setting> settings;
};

const EffectRow kEffects[] = {
    {"gain", "Gain", {{"Gain", "-3"}}},
    {"tremolo", "Tremolo", {}},
    {"chorus", "Chorus", {}},
    {"echo", "Echo", {}},
    {"tube, no oversampling", "Valvex", {{"Drive L", "50"}, {"Drive R", "50"}}},
    {"tube, 8x",
     "Valvex",
     {{"Drive L", "50"}, {"Drive R", "50"}, {"Oversampling L", "8"}, {"Oversampling R", "8"}}},
    {"phaser, 6 stages", "Phaser", {{"Stages", "6"}}},
    {"phaser, 30 stages", "Phaser", {{"Stages", "30"}}},
    {"compressor", "Compressor", {}},
    {"reverb", "Reverb", {}},
    {"noise reducer", "Denoiser", {}},
    {"pitch correction", "Cantrix", {}},
};

dsp_effect* Prepared(const EffectRow& row) {
    dsp_effect* effect = nullptr;
    Check(dsp_effect_create(row.effect, &effect, nullptr), row.name);
    for (const auto& [parameter, text] : row.settings) {
        int32_t index = 0;
        float value = 0;
        Check(dsp_effect_find_parameter(effect, parameter, &index, nullptr), parameter);
        Check(dsp_effect_text_to_value(effect, index, text, &value, nullptr), text);
        Check(dsp_effect_set(effect, index, value), parameter);
    }
    const dsp_format format{sizeof format, kRate, 2, DSP_F32, kFrames};
    Check(dsp_effect_prepare(effect, &format, nullptr), row.name);
    return effect;
}

void Effects(const std::vector<float>& noise) {
    auto block = noise;
    for (const auto& row : kEffects) {
        auto* effect = Prepared(row);
        Report(row.name, kFrames, [&] {
            std::copy(noise.begin(), noise.end(), block.begin());
            dsp_effect_process_f32(effect, block.data(), kFrames);
        });
        dsp_close(effect);
    }
}

int Frequency(int band) { return 60 + 900 * band; }

void SetPeaks(dsp_equaliser* equaliser, int bands, double boost) {
    std::vector<dsp_band> peaks;
    for (int i = 0; i < bands; ++i)
        peaks.push_back({sizeof(dsp_band), DSP_PEAK, Frequency(i), 150, 0, 0, i % 2 ? boost : -boost});
    Check(dsp_equaliser_set_bands(equaliser, peaks.data(), bands, nullptr), "bands");
}

// Gliding means that every block has a new target, before it has reached the last one.
void Equaliser(const std::vector<float>& noise, int bands, bool gliding) {
    dsp_equaliser* equaliser = nullptr;
    Check(dsp_equaliser_create(&equaliser, nullptr), "equaliser");
    SetPeaks(equaliser, bands, 60);
    const dsp_format format{sizeof format, kRate, 2, DSP_F32, kFrames};
    Check(dsp_equaliser_prepare(equaliser, &format, nullptr), "equaliser");
    auto block = noise;
    double boost = 60;
    Report("equaliser, " + std::to_string(bands) + (gliding ? " bands gliding" : " bands"), kFrames, [&] {
        std::copy(noise.begin(), noise.end(), block.begin());
        if (gliding) SetPeaks(equaliser, bands, boost = 90 - boost);
        dsp_equaliser_process_f32(equaliser, block.data(), kFrames);
    });
    dsp_close(equaliser);
}

void PlainEqualiserGliding(const std::vector<float>& noise, int bands) {
    Plain::ParEQ<Plain::ExponentialProgress> equaliser(2);
    const auto peaks = [&](int boost) {
        Corvo::DSP::builtin_effects_data data;
        data.numBands = bands;
        for (int i = 0; i < bands; ++i)
            data.SetEqData(i, {Corvo::DSP::EQ_PEAK, Frequency(i), i % 2 ? boost : -boost, 150});
        return data;
    };
    auto low = peaks(30), high = peaks(60);
    Corvo::DSP::builtin_effects_data records[] = {high, high};
    equaliser.Cook(false, false, high, kRate);
    auto block = noise;
    bool turn = false;
    Report("plain equaliser, " + std::to_string(bands) + " bands gliding", kFrames, [&] {
        const Corvo::DenormalGuard guard;
        std::copy(noise.begin(), noise.end(), block.begin());
        equaliser.Cook(true, false, (turn = !turn) ? low : high, kRate);
        equaliser.Process(block.data(), kFrames, 2, records);
    });
}

void Converter(const std::vector<float>& noise, int from, int to) {
    const dsp_conversion conversion{sizeof conversion, from, to, 2, DSP_F32, DSP_F32, DSP_DITHER_NONE, 0};
    dsp_converter* converter = nullptr;
    Check(dsp_converter_create(&conversion, &converter, nullptr), "converter");
    std::vector<float> out(8 * noise.size());
    Report("converter, " + std::to_string(from) + " to " + std::to_string(to), kFrames, [&] {
        int32_t written = 0;
        dsp_converter_process(converter, noise.data(), kFrames, out.data(), 4 * kFrames, &written);
    });
    dsp_close(converter);
}

void PitchShift(const std::vector<float>& noise, const char* name, int engine) {
    const dsp_shift shift{sizeof shift, kRate, 2, engine, 1, 0, 3.0, 1.0};
    dsp_pitch_shift* pitch = nullptr;
    Check(dsp_pitch_shift_create(&shift, &pitch, nullptr), name);
    std::vector<float> out(4 * noise.size());
    Report(name, kFrames, [&] {
        int32_t written = 0;
        Check(dsp_pitch_shift_feed(pitch, noise.data(), kFrames), name);
        do {
            Check(dsp_pitch_shift_take(pitch, out.data(), 2 * kFrames, &written), name);
        } while (written > 0);
    });
    dsp_close(pitch);
}

template <typename Sample>
void Transform(const char* type, int length, dsp_status (*run)(dsp_transform*, Sample*, int32_t)) {
    dsp_transform* transform = nullptr;
    Check(dsp_transform_create(length, 0, &transform, nullptr), "transform");
    auto values = TestSupport::Noise<Sample>(static_cast<std::size_t>(length));
    // There and back, so that the values stay what they are without being copied: Wine's memcpy is slow.
    Report("transform of " + std::to_string(length) + " " + type, 2, [&] {
        run(transform, values.data(), 0);
        run(transform, values.data(), 1);
    });
    dsp_close(transform);
}

// A refresh of the display after what has sounded since the last: 1600 frames.
void Analyser(const char* name, std::vector<int> switches) {
    constexpr int kSince = kRate / 30;
    dsp_analyser* analyser = nullptr;
    Check(dsp_analyser_create(kRate, &analyser, nullptr), name);
    for (const int which : switches) Check(dsp_analyser_switch(analyser, which, 1), name);
    const auto sound = TestSupport::Sine<float>(kRate, 220.5, kRate, 0.5, 2);
    std::size_t at = 0;
    Report(name, kSince, [&] {
        dsp_analyser_feed_f32(analyser, sound.data() + 2 * at, kSince, 2);
        at = (at + kSince) % (kRate - kSince);
        dsp_analyser_refresh(analyser, nullptr);
    });
    dsp_close(analyser);
}

}  // namespace

int main(int count, char** arguments) {
    if (count > 1) wanted = arguments[1];
    const auto noise = TestSupport::Noise<float>(2 * kFrames);
    Effects(noise);
    for (const int bands : {3, 8, 20}) Equaliser(noise, bands, false);
    Equaliser(noise, 8, true);
    PlainEqualiserGliding(noise, 8);
    for (const auto& [from, to] : {std::pair{44100, 48000}, {48000, 44100}, {48000, 96000}, {96000, 44100}})
        Converter(noise, from, to);
    PitchShift(noise, "pitch, Classic", DSP_ENGINE_CLASSIC);
    PitchShift(noise, "pitch, New", DSP_ENGINE_NEW);
    for (const int length : {1024, 4096, 65536}) {
        Transform<float>("floats", length, dsp_transform_f32);
        Transform<double>("doubles", length, dsp_transform_f64);
    }
    Analyser("analyser", {});
    Analyser("analyser with tuner", {DSP_TUNER_ON});
    Analyser("analyser with sonogram", {DSP_SHOW_SONOGRAM});
}
