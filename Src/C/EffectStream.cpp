#include "C/EffectStream.h"

#include <algorithm>
#include <new>
#include <utility>

namespace Corvo::C {

double TempoSource::GetTempo() { return Ask().bpm; }

void TempoSource::GetTimeSignature(int& numerator, int& denominator) {
    const dsp_tempo tempo = Ask();
    numerator = tempo.numerator;
    denominator = tempo.denominator;
}

dsp_tempo TempoSource::Ask() const {
    dsp_tempo tempo{sizeof(dsp_tempo), 4, 4, 0, 120.0};
    m_callback(m_user, &tempo);
    return tempo;
}

EffectStream::EffectStream(const DSP::EffectKind& effectKind)
    : Object(kKind),
      effect(effectKind.MakeReady()),
      m_announced(static_cast<std::size_t>(Busses())),
      m_sidechain(m_announced.size()) {}

void EffectStream::Prepare(const tWAVEFORMATEX& format, int maxFrames) {
    const std::size_t samples = static_cast<std::size_t>(maxFrames) * format.nChannels;
    m_maxFrames = 0;
    m_scratch.assign(effect->SupportsNoninterleaved() ? 0 : samples, 0.0);
    m_format = format;
    m_maxFrames = maxFrames;
    Restart();
}

void EffectStream::Restart() {
    effect->Cleanup();
    effect->InitProcessing(m_maxFrames, &m_format);
    if (!effect->IsPrepared()) {
        m_maxFrames = 0;
        throw std::bad_alloc();
    }
    std::ranges::fill(m_sidechain, Pointers{});
    m_tailFrames = 0;
    Seek(0);
}

void EffectStream::Seek(std::int64_t position) {
    m_position = position;
    for (Lane& lane : m_lanes) {
        const auto due = std::ranges::upper_bound(lane.points, position, {}, &dsp_point::frame);
        // The last point that is due is played again.
        lane.next = static_cast<std::size_t>(std::max<std::ptrdiff_t>(due - lane.points.begin() - 1, 0));
    }
}

void EffectStream::Automate(int parameter, std::span<const dsp_point> points) {
    m_lanes.reserve(m_lanes.size() + 1);
    Lane lane{parameter, {points.begin(), points.end()}, 0};
    std::erase_if(m_lanes, [parameter](const Lane& other) { return other.parameter == parameter; });
    if (!points.empty()) m_lanes.push_back(std::move(lane));
    Seek(m_position);
}

void EffectStream::AnnounceSidechain(int bus, int channels) {
    m_announced[static_cast<std::size_t>(bus)] = channels;
    m_sidechain[static_cast<std::size_t>(bus)] = {};
    // In ascending order: announcing one discards all above it.
    for (int b = bus; b < Busses(); ++b) effect->SetSidechainBusNumChannels(b, SidechainChannels(b));
}

void EffectStream::SetSidechain(int bus, const void* const* channels) {
    auto& pointers = m_sidechain[static_cast<std::size_t>(bus)];
    pointers = {};
    for (int c = 0; channels && c < std::min(SidechainChannels(bus), kMostChannels); ++c)
        pointers[static_cast<std::size_t>(c)] = static_cast<const std::byte*>(channels[c]);
}

void EffectStream::HandOverSidechain(int from) {
    const std::ptrdiff_t offset = static_cast<std::ptrdiff_t>(from) * (Bits() / 8);
    for (std::size_t bus = 0; bus < m_sidechain.size(); ++bus) {
        double* at[kMostChannels]{};
        for (std::size_t c = 0; c < kMostChannels; ++c)
            if (const std::byte* const channel = m_sidechain[bus][c])
                at[c] = reinterpret_cast<double*>(const_cast<std::byte*>(channel + offset));
        if (at[0]) effect->SetSidechainBuffer(static_cast<int>(bus), at);
    }
}

// Not as envelopes: an effect plays those from the start after every move, and in the end does nothing else.
void EffectStream::PlayDue() {
    for (Lane& lane : m_lanes)
        // Before its first point a parameter has that point's value.
        for (;
             lane.next < lane.points.size() && (lane.next == 0 || lane.points[lane.next].frame <= m_position);
             ++lane.next)
            effect->SetParam(lane.parameter, lane.points[lane.next].value, true);
}

// How much of a block can be processed before a point is due.
int EffectStream::PieceFrames(int left) const {
    std::int64_t frames = std::min(left, m_maxFrames);
    for (const Lane& lane : m_lanes)
        if (lane.next < lane.points.size())
            frames = std::min(frames, lane.points[lane.next].frame - m_position);
    return static_cast<int>(frames);
}

// process(first frame, frames) for every piece of the block.
template <typename ProcessPiece>
void EffectStream::Cut(int frames, ProcessPiece process) {
    m_tailFrames = 0;
    for (int done = 0; done < frames;) {
        PlayDue();
        const int piece = PieceFrames(frames - done);
        HandOverSidechain(done);
        process(done, piece);
        m_tailFrames += effect->TailFramesProduced();
        done += piece;
        m_position += piece;
    }
    std::ranges::fill(m_sidechain, Pointers{});
}

template <typename Sample>
void EffectStream::Process(Sample* samples, int frames) {
    Cut(frames, [&](int first, int count) {
        DSP::ProcessFlags flags;
        effect->Process(reinterpret_cast<double*>(samples + static_cast<std::ptrdiff_t>(first) * Channels()),
                        count, &m_format, flags);
    });
}

template <typename Sample>
void EffectStream::ProcessPlanar(Sample* const* channels, int frames) {
    DSP::ProcessFlags flags;
    const int width = Channels();
    if (effect->SupportsNoninterleaved()) {
        Cut(frames, [&](int first, int count) {
            double* at[kMostChannels]{};
            for (int c = 0; c < width; ++c) at[c] = reinterpret_cast<double*>(channels[c] + first);
            effect->ProcessNoninterleaved(at, count, &m_format, flags);
        });
        return;
    }
    auto* const block = reinterpret_cast<Sample*>(m_scratch.data());
    Cut(frames, [&](int first, int count) {
        for (int c = 0; c < width; ++c)
            for (int i = 0; i < count; ++i) block[i * width + c] = channels[c][first + i];
        effect->Process(m_scratch.data(), count, &m_format, flags);
        for (int c = 0; c < width; ++c)
            for (int i = 0; i < count; ++i) channels[c][first + i] = block[i * width + c];
    });
}

template void EffectStream::Process(float*, int);
template void EffectStream::Process(double*, int);
template void EffectStream::ProcessPlanar(float* const*, int);
template void EffectStream::ProcessPlanar(double* const*, int);

}  // namespace Corvo::C
