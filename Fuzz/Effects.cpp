// A host that does everything in any order to any effect: chunks, presets, texts, edits, automation, formats.
#include <algorithm>
#include <cmath>

#include "EffectSettings.h"
#include "Support/EffectCases.h"

namespace {

using Fuzz::Input;
using Fuzz::Require;

struct Host : CorvoEffectHostCallback {
    double GetTempo() override { return tempo; }
    void GetTimeSignature(int& n, int& d) override {
        n = numerator;
        d = denominator;
    }
    double tempo = 120.0;
    int numerator = 4, denominator = 4;
};

struct Session : Fuzz::EffectSettings {
    Host host{};
    tWAVEFORMATEX format{};
    int largest = 0;
    std::vector<double> sideChain{};

    void ChooseFormat() {
        static constexpr std::uint32_t kRates[]{48000, 44100, 8000, 96000, 192000, 768000, 1000, 1, 0};
        static constexpr std::uint16_t kBits[]{32, 64, 32, 64, 16, 24, 8, 0};
        format.wFormatTag = 3;
        format.nChannels = static_cast<std::uint16_t>(input.Flag() ? 2 : input.Between(0, 9));
        format.nSamplesPerSec = input.OneOf(kRates);
        format.wBitsPerSample = input.OneOf(kBits);
    }
    void Prepare() {
        ChooseFormat();
        largest = input.Between(0, 700);
        Require(effect->InitProcessing(largest, &format), "preparation is always true");
        Require(effect->GetLatency() >= 0, "latency is not negative");
    }
    void Play() {
        const auto frames = input.Between(0, largest);
        auto block = input.Samples<double>(static_cast<std::size_t>(frames) * format.nChannels);
        Corvo::DSP::ProcessFlags flags{.force_cook = input.Flag()};
        effect->Process(block.data(), frames, &format, flags);
        const int produced = effect->TailFramesProduced();
        Require(produced >= 0 && produced <= frames, "a tail is no longer than its block");
        Require(effect->LongestGap() >= 0.0, "a gap is not negative");
    }
    void PlayFloats() {
        const auto frames = input.Between(0, largest);
        // As wide as doubles: other widths count as either.
        auto block = input.Samples<float>(2 * static_cast<std::size_t>(frames) * format.nChannels);
        Corvo::DSP::ProcessFlags flags;
        effect->Process(block.data(), frames, &format, flags);
    }
    void PlayPlanar() {
        const auto frames = input.Between(0, largest);
        std::vector<std::vector<double>> planes;
        std::vector<double*> channels;
        for (int i = 0; i < format.nChannels; ++i)
            planes.push_back(input.Samples<double>(static_cast<std::size_t>(frames)));
        for (auto& plane : planes) channels.push_back(plane.data());
        Corvo::DSP::ProcessFlags flags;
        effect->ProcessNoninterleaved(channels.data(), frames, &format, flags);
    }
    void Automate() {
        std::vector<MP_ENVELOPE_SEGMENT> segments(static_cast<std::size_t>(input.Between(0, 6)));
        for (auto& segment : segments) {
            segment.rtStart = input.Flag() ? input.Between(-1000, 30000) : input.Raw<std::int64_t>();
            segment.rtEnd = segment.rtStart / 2 + input.Between(0, 20000);
            segment.valStart = input.Value();
            segment.valEnd = input.Value();
        }
        const auto count = static_cast<int>(segments.size());
        effect->AddEnvelope(input.Between(-1, effect->GetParamCountReal()), count, segments.data());
        effect->SetEnvelopeTime(input.Flag() ? 0 : input.Raw<std::int64_t>());
    }
    void SideChain() {
        const int bus = input.Between(0, 1);
        effect->SetSidechainBusNumChannels(bus, input.Between(0, 3));
        sideChain = input.Samples<double>(700);
        static double* channels[2];
        channels[0] = channels[1] = sideChain.data();
        effect->SetSidechainBuffer(0, input.Flag() ? channels : nullptr);
    }
    void Tail() {
        if (input.Flag())
            effect->StartTail(input.Flag() ? input.Raw<std::int64_t>() : 5000);
        else
            effect->EndTail();
        if (input.Flag()) effect->RequestTailRestart();
        effect->TailFinished();
    }
    void ChangeHost() {
        host.tempo = input.Flag() ? input.Between(1, 400) : input.Raw<double>();
        host.numerator = input.Flag() ? 3 : input.Raw<std::int32_t>();
        host.denominator = input.Flag() ? 8 : input.Raw<std::int32_t>();
        effect->SetHostCallback(&host);
        effect->NotifyTempoChanged();
    }
    // What overflows, at once or a delay later, is forgotten in the block where it shows.
    template <typename Sample>
    void EndInSilence() {
        bool before = true;
        for (int i = 0; i < 3; ++i) {
            std::vector<Sample> block(static_cast<std::size_t>(largest) * format.nChannels);
            Corvo::DSP::ProcessFlags flags;
            effect->Process(reinterpret_cast<double*>(block.data()), largest, &format, flags);
            const bool finite =
                std::ranges::all_of(block, [](Sample sample) { return std::isfinite(sample); });
            Require(finite || before, "silence after a block that overflowed comes out finite");
            before = finite;
        }
    }
    void Rewind() { effect->InitResetProcessingLight(input.Flag()); }
    void StartOver() {
        effect->Cleanup();
        Prepare();
    }
};

constexpr void (Session::*kSteps[])() = {
    &Session::Play,  &Session::PlayFloats, &Session::PlayPlanar, &Session::Edit,      &Session::AskTexts,
    &Session::Parse, &Session::Chunk,      &Session::Preset,     &Session::Automate,  &Session::SideChain,
    &Session::Tail,  &Session::ChangeHost, &Session::Rewind,     &Session::StartOver, &Session::Prepare,
};

const Fuzz::Target target("Effects", [](Input& input) {
    const auto all = TestSupport::AllEffects();
    const auto which = static_cast<std::size_t>(input.Between(0, static_cast<int>(all.size()) - 1));
    Session session{{input, all[which].Make()}};
    session.Preset();
    session.Prepare();
    for (int step = 0; step < 60 && !input.AtEnd(); ++step) (session.*input.OneOf(kSteps))();
    if (session.format.wBitsPerSample == 32)
        session.EndInSilence<float>();
    else if (session.format.wBitsPerSample == 64)
        session.EndInSilence<double>();
});

}  // namespace
