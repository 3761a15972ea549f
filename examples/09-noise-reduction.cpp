// Noise reduction with a learned profile: play the noise alone, then the whole recording.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <numbers>
#include <numeric>
#include <random>
#include <vector>

#include "DSP/Effects/EffectKinds.h"
#include "DSP/Effects/ParameterInput.h"
using namespace Corvo::DSP;
constexpr int kRate = 48000, kBlock = 512;

static void Set(CorvoEffectBase& effect, const char* name, const char* value) {
    for (const int index : FindParameters(effect, name))
        effect.SetParam(index, ReadParameter(effect, index, value).normalised, false);
}

// The mean level of seconds `from` to `to`.
static double Level(const std::vector<double>& sound, int from, int to) {
    const auto start = sound.begin() + from * kRate, end = sound.begin() + to * kRate;
    return 10.0 * std::log10(std::inner_product(start, end, start, 1e-9) / kRate);
}

int main() {
    // Five seconds: hiss, and from second 3 to 4 a note.
    std::mt19937 random(1);
    std::normal_distribution<double> hiss(0.0, 0.01);
    std::vector<double> recording(5 * kRate);
    for (double& sample : recording) sample = hiss(random);
    for (int i = 3 * kRate; i < 4 * kRate; ++i)
        recording[i] += 0.2 * std::sin(2.0 * std::numbers::pi * 440.0 * i / kRate);
    const auto denoiser = FindEffectKind("Denoiser")->MakeReady();
    tWAVEFORMATEX format{};
    format.nChannels = 1;
    format.nSamplesPerSec = kRate;
    format.wBitsPerSample = 64;
    denoiser->InitProcessing(kBlock, &format);
    const auto play = [&](std::vector<double> sound) {
        ProcessFlags flags;
        for (int i = 0, end = static_cast<int>(sound.size()); i < end; i += kBlock)
            denoiser->Process(&sound[i], std::min(kBlock, end - i), &format, flags);
        return sound;
    };
    Set(*denoiser, "Profile", "Learned");
    Set(*denoiser, "Learn", "On");  // while it learns, the sound passes as it is
    play({recording.begin(), recording.begin() + 2 * kRate});
    Set(*denoiser, "Learn", "Off");

    const int late = denoiser->GetLatency();  // so: silence at the end, and as much dropped at the start
    recording.resize(recording.size() + late);
    std::vector<double> cleaned = play(recording);
    cleaned.erase(cleaned.begin(), cleaned.begin() + late);
    const double noise = Level(cleaned, 1, 2) - Level(recording, 1, 2);
    const double note = Level(cleaned, 3, 4) - Level(recording, 3, 4);
    std::printf("the hiss by %.1f dB, the note by %.2f dB\n", noise, note);
    return noise < -15.0 && std::abs(note) < 0.5 ? 0 : 1;
}
