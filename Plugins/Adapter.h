#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "Core.h"
#include "Host/CorvoEffectHostCallback.h"

namespace Corvo::Plugins {

// An effect behind all that plug-in formats want of it.
class Adapter final : public Core, CorvoEffectHostCallback {
public:
    // For 1 or 2 channels. Throws std::bad_alloc.
    Adapter(const PluginRow& row, int channels, Values values = Values::OfPlugin);
    ~Adapter() override;

    int SideChannels() const override { return m_sideChannels; }
    void SetChannels(int channels) override;
    void Prepare(double rate, int frames) override;
    void Reset() override;
    void Set(int port, float value) override;
    float Value(int port) const override;
    void Recall(const std::vector<float>& values) override;
    void Tempo(double bpm, int numerator, int denominator) override;
    void Run(const float* const* in, float* const* out, const float* const* side, int frames) override;
    int Latency() const override { return m_latency; }
    std::vector<std::uint8_t> State() override;
    bool TakeState(const std::vector<std::uint8_t>& bytes) override;
    int Presets() override { return m_effect->NumPresets(); }
    std::string PresetName(int preset) override { return m_effect->GetPresetName(preset); }
    int StartPreset() override { return m_effect->GetDefaultPreset(); }
    void TakePreset(int preset) override;
    bool HasOtherValues() const override { return m_otherValues; }
    bool TakeOtherValues() override { return m_otherValues.exchange(false); }
    std::string Text(int port, float value) override;
    bool FromText(int port, const std::string& text, float& value) override;

private:
    class Gate;

    // What a port stands at. `wanted` is the host's, `position` the effect's.
    struct Control {
        std::atomic<float> wanted{0.0f};
        std::atomic<bool> edited{false};  // `wanted` has not reached the effect
        float position = 0.0f, target = 0.0f;
        int stepsLeft = 0;                 // of a glide
        std::atomic<bool> touched{false};  // set while processing, since the state was taken as a whole
    };

    double GetTempo() override { return m_bpm; }
    void GetTimeSignature(int& numerator, int& denominator) override;

    std::unique_ptr<DSP::CorvoEffectBase> Copy();
    void ReadBack();
    void Apply(std::size_t port, float position);
    void TakeEdits(bool glide);
    bool TakeEditsOf(bool lists, bool glide);
    void ReadBackOthers();
    void KeepOthers();
    void StepGlides();
    void Start();
    void SilenceResults();
    void TellResults();
    void TakeInput(const std::array<const float*, 2>& in, const std::array<float*, 2>& out, int frames);
    void TakeSide(const std::array<const float*, 2>& side, int frames);
    void ProcessEffect(int at, int frames);
    void Give(const std::array<float*, 2>& out, int frames);
    void UpdateLatency();

    const Values m_values;
    const std::unique_ptr<DSP::CorvoEffectBase> m_effect;
    const bool m_planar;
    int m_sideChannels = 0;
    const std::unique_ptr<Results> m_results;  // null without any
    std::vector<Control> m_controls;           // of the ports before the outputs
    std::vector<float> m_newest;               // of the outputs
    std::vector<std::atomic<float>> m_told;
    std::atomic<bool> m_edits{false}, m_otherValues{false};
    std::atomic_flag m_busy = ATOMIC_FLAG_INIT;  // someone sets parameters
    int m_gliding = 0;                           // ports

    tWAVEFORMATEX m_format{};
    int m_longest = 0;  // frames of a piece
    int m_glideSteps = 1;
    std::array<std::vector<float>, 2> m_wet, m_side;
    std::array<float*, 2> m_work{};           // where the effect processes the piece at hand
    std::vector<float> m_interleaved;         // for an effect that takes stereo so; else empty
    std::array<std::vector<float>, 2> m_dry;  // rings of the input
    std::size_t m_dryAt = 0;                  // where the next frame is written
    bool m_sideHeard = false, m_sideIsThere = false;
    std::atomic<int> m_latency{0};

    float m_mix = 1.0f, m_goal = 1.0f, m_mixStep = 0.0f;  // share of the effect
    bool m_fresh = true;                                  // nothing was processed yet
    std::atomic<double> m_bpm{120.0};
    std::atomic<int> m_numerator{4}, m_denominator{4};
};

}  // namespace Corvo::Plugins
