#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Host/CorvoEffectHostCallback.h"
#include "Ports.h"

namespace Corvo::Plugins {

// An effect as plug-in formats want it: ports in plain numbers, planar floats, a bypass, its state as bytes.
// Each format's shell is made of one of these.
//
// Threads: Set, Bypass, Tempo and Run belong to the thread that processes; while nothing is processed any one
// thread may call them. Everything else belongs to another thread, and may be called while Run runs, except
// Prepare and Reset. Run neither allocates nor waits, unless the effect's own row says that it may.
class Adapter final : CorvoEffectHostCallback {
public:
    // What the values of the first block after preparation are: changes like all others, or what the sound
    // begins with. For formats that hand over values with the first block only; that block may allocate then.
    enum class Start { AsPrepared, WithFirstValues };

    // For 1 or 2 channels. Throws std::bad_alloc.
    Adapter(const PluginRow& row, int channels, Start start = Start::AsPrepared);
    ~Adapter() override;

    const PluginRow& Row() const { return m_row; }
    const std::vector<Port>& Ports() const { return m_layout.ports; }
    int Channels() const { return m_channels; }
    int SideChannels() const { return m_sideChannels; }  // of the side-chain; 0 without one
    // 1 or 2 channels from the next preparation on; nothing is processed until then. The ports stay.
    void SetChannels(int channels);

    // Makes all memory, for blocks of about `frames`; longer ones are cut. Throws std::bad_alloc.
    void Prepare(double rate, int frames);
    void Reset();  // silence, as after Prepare

    // The value that a host reads back; NaN and what is no other value are ignored. A continuous port glides
    // to it over some milliseconds while sound is processed.
    void Set(int port, float value);
    float Value(int port) const;
    // After TakeState: the values that a host had set. They are told again where the effect stores the same
    // for them, being coarser.
    void Recall(const std::vector<float>& values);
    // Over 20 ms from the effect to its delayed input, or back.
    void Bypass(bool on) { m_bypass = on; }
    bool Bypassed() const { return m_bypass; }
    void Tempo(double bpm, int numerator, int denominator);

    // One block of any length, 0 included. Buffers may be the same in any combination. `side` may be null,
    // and counts as absent until something else than silence came from it. Samples that are not finite count
    // as 0.
    void Run(const float* const* in, float* const* out, const float* const* side, int frames);
    int Latency() const { return m_latency; }  // in frames; of the last block or preparation

    // The effect's settings chunk.
    std::vector<std::uint8_t> State();
    // False, with nothing changed, for bytes that the effect does not take.
    bool TakeState(const std::vector<std::uint8_t>& bytes);
    int Presets() { return m_effect->NumPresets(); }
    std::string PresetName(int preset) { return m_effect->GetPresetName(preset); }
    int StartPreset() { return m_effect->GetDefaultPreset(); }  // that a new instance has
    void TakePreset(int preset);
    // True once after values changed that the host did not set.
    bool TakeOtherValues() { return m_otherValues.exchange(false); }

    std::string Text(int port, float value);
    bool FromText(int port, const std::string& text, float& value);

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
    void StepGlides();
    void Restart();
    void ProcessPiece(const float* const* in, float* const* out, const float* const* side, int frames);
    void TakeInput(const float* const* in, int frames);
    void TakeSide(const float* const* side, int frames);
    void ProcessEffect(int frames);
    void Give(float* const* out, int frames);
    void UpdateLatency();

    const PluginRow& m_row;
    int m_channels;
    const Start m_start;
    const Layout& m_layout;
    const std::unique_ptr<DSP::CorvoEffectBase> m_effect;
    const bool m_planar;
    int m_sideChannels = 0;
    std::vector<Control> m_controls;
    std::atomic<bool> m_edits{false}, m_otherValues{false};
    std::atomic_flag m_busy = ATOMIC_FLAG_INIT;  // someone sets parameters
    int m_gliding = 0;                           // ports

    tWAVEFORMATEX m_format{};
    int m_longest = 0;  // frames of a piece
    int m_glideSteps = 1;
    std::array<std::vector<float>, 2> m_wet, m_side;
    std::vector<float> m_interleaved;         // for an effect that takes stereo so; else empty
    std::array<std::vector<float>, 2> m_dry;  // rings of the input
    std::size_t m_dryAt = 0;                  // where the next frame is written
    bool m_sideHeard = false;
    std::atomic<int> m_latency{0};

    std::atomic<bool> m_bypass{false};
    float m_mix = 1.0f, m_goal = 1.0f, m_mixStep = 0.0f;  // share of the effect
    bool m_fresh = true;                                  // nothing was processed yet
    std::atomic<double> m_bpm{120.0};
    std::atomic<int> m_numerator{4}, m_denominator{4};
};

}  // namespace Corvo::Plugins
