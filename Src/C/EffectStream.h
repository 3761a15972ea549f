#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

#include "C/Handles.h"
#include "DSP/Effects/EffectKinds.h"
#include "Host/CorvoEffectHostCallback.h"

namespace Corvo::C {

// Asks the C host for tempo and time signature.
class TempoSource : public CorvoEffectHostCallback {
public:
    TempoSource(dsp_tempo_callback callback, void* user) : m_callback(callback), m_user(user) {}
    double GetTempo() override;
    void GetTimeSignature(int& numerator, int& denominator) override;

private:
    dsp_tempo Ask() const;

    dsp_tempo_callback m_callback;
    void* m_user;
};

// An effect with its stream. Blocks are cut where they are too long and where a parameter is automated, so
// that points are met to the frame.
class EffectStream : public Object {
public:
    static constexpr Kind kKind = Kind::Effect;
    static constexpr int kMostChannels = DSP::CorvoEffectBase::MaxNumChannels;

    explicit EffectStream(const DSP::EffectKind& effectKind);

    // Announces the format and the longest piece.
    void Prepare(const tWAVEFORMATEX& format, int maxFrames);
    // Starts anew, as prepared. Both throw std::bad_alloc, and are not prepared then.
    void Restart();
    bool IsPrepared() const { return m_maxFrames > 0; }
    int Bits() const { return m_format.wBitsPerSample; }
    int Channels() const { return m_format.nChannels; }

    // Positions, and those of points, stay far from where 64 bits end.
    static constexpr std::int64_t kLastFrame = std::int64_t{1} << 61;
    void Seek(std::int64_t position);
    // Replaces the automation of an external parameter.
    void Automate(int parameter, std::span<const dsp_point> points);

    int Busses() const { return std::max(effect->GetNumSidechainBusses(), 0); }
    void AnnounceSidechain(int bus, int channels);
    int SidechainChannels(int bus) const { return m_announced[static_cast<std::size_t>(bus)]; }
    // Planar, for the next block only; null for none.
    void SetSidechain(int bus, const void* const* channels);

    // Of the last block, all its pieces together.
    int TailFrames() const { return m_tailFrames; }

    template <typename Sample>
    void Process(Sample* samples, int frames);
    template <typename Sample>
    void ProcessPlanar(Sample* const* channels, int frames);

    const std::unique_ptr<DSP::CorvoEffectBase> effect;
    std::unique_ptr<TempoSource> tempo;

private:
    using Pointers = std::array<const std::byte*, kMostChannels>;

    // The automation of one parameter.
    struct Lane {
        int parameter;
        std::vector<dsp_point> points;
        std::size_t next;  // the first that was not played
    };

    template <typename ProcessPiece>
    void Cut(int frames, ProcessPiece process);
    void PlayDue();
    int PieceFrames(int left) const;
    void HandOverSidechain(int from);

    tWAVEFORMATEX m_format{};
    int m_maxFrames = 0;  // 0 before the first preparation
    std::int64_t m_position = 0;
    int m_tailFrames = 0;
    std::vector<Lane> m_lanes;
    std::vector<int> m_announced;       // channels by side-chain bus
    std::vector<Pointers> m_sidechain;  // of the next block
    std::vector<double> m_scratch;      // a planar piece, interleaved for an effect that takes no others
};

}  // namespace Corvo::C
