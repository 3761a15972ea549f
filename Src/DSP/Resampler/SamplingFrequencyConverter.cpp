#include "DSP/Resampler/SamplingFrequencyConverter.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <new>

#include "DSP/Resampler/GroupRun.h"
#include "Platform/DenormalGuard.h"
#include "Platform/FiniteSamples.h"

using PolePairs::Block;
using PolePairs::GroupRun;
using PolePairs::State;

namespace {

constexpr int kTaps = SamplingFrequencyConverter::kOrder + 1;  // of a history in use

// The newest values of a group's stream at the raised rate, at most as many as a history holds: what went
// into the filter, and L times what came out of it.
struct Newest {
    int frames = 0, first = 0, count = 0;  // from step `first` of the oldest of these frames on
    const double *samples = nullptr, *raised = nullptr;
};

// Makes room for so many values at the end of a history and returns where they go.
double* Shifted(double* history, int count) {
    std::shift_left(history, history + kTaps, count);
    return history + kTaps - count;
}

bool AllZero(const double* history) {
    return std::all_of(history, history + kTaps, [](double value) { return value == 0.0; });
}

// Moves a ring position by `steps` and returns how often it went round.
int Advance(int& position, std::int64_t steps, int ringLength) {
    const std::int64_t moved = position + steps;
    position = static_cast<int>(moved % ringLength);
    return static_cast<int>(moved / ringLength);
}

// Brings histories and ring of one channel up to date.
void Record(SamplingFrequencyConverter& c, int channel, const Newest& newest, std::size_t lane,
            int ringPosition) {
    double* const input = Shifted(c.inputHistory[channel], newest.count);
    std::fill_n(input, newest.count, 0.0);
    for (int i = newest.first > 0; i < newest.frames; ++i)
        input[i * c.up - newest.first] =
            newest.samples[static_cast<std::size_t>(i) * State::kLanes + lane] * (1.0 / c.lowPass.gain);
    double* const output = Shifted(c.outputHistory[channel], newest.count);
    double* const ring = c.rings[channel];
    const double* raised = newest.raised + lane;
    for (int i = 0; i < newest.count; ++i, raised += State::kLanes) {
        output[i] = *raised * (1.0 / c.up);
        ring[ringPosition] = *raised;
        if (++ringPosition == c.ringLength) ringPosition = 0;
    }
}

// Converts one group, then brings its channels' histories and rings up to date.
template <typename In, typename Out, int kChannels>
int ConvertGroup(SamplingFrequencyConverter& c, int firstChannel, const Block& block,
                 std::int64_t toNextOutput) {
    constexpr int kGroup = SamplingFrequencyConverter::kChannelsPerGroup;
    auto& stored = c.pairStates[firstChannel / kGroup];
    const int firstLane = firstChannel % kGroup;
    for (int lane = 0; lane < kChannels; ++lane) {
        const int channel = firstChannel + lane;
        if (AllZero(c.inputHistory[channel]) && AllZero(c.outputHistory[channel]))
            for (auto& value : stored) value[firstLane + lane] = 0.0;
    }
    // A single channel may be stored in either lane; it is computed in the first.
    State state;
    for (std::size_t k = 0; k < State::kPairs; ++k) {
        std::copy_n(stored[2 * k] + firstLane, kChannels, state.value[k]);
        std::copy_n(stored[2 * k + 1] + firstLane, kChannels, state.change[k]);
    }

    GroupRun<In, Out, kChannels> run(c, state, block, toNextOutput);
    Newest newest;
    newest.frames = std::min(block.frames, (kTaps + c.up - 1) / c.up);
    newest.first = std::max(0, newest.frames * c.up - kTaps);
    newest.count = newest.frames * c.up - newest.first;
    run.Run(block.frames - newest.frames);
    const State before = run.Filter();
    run.Run(newest.frames);
    newest.samples = run.Samples();
    newest.raised = run.Raised(before, static_cast<std::size_t>(newest.frames), newest.first);

    for (std::size_t k = 0; k < State::kPairs; ++k) {
        std::copy_n(run.Filter().value[k], kChannels, stored[2 * k] + firstLane);
        std::copy_n(run.Filter().change[k], kChannels, stored[2 * k + 1] + firstLane);
    }
    int position = c.writePosition;
    Advance(position, static_cast<std::int64_t>(block.frames) * c.up - newest.count, c.ringLength);
    for (int lane = 0; lane < kChannels; ++lane)
        Record(c, firstChannel + lane, newest, static_cast<std::size_t>(lane), position);
    return run.Written();
}

template <typename In>
double ReadAt(const char* frame, int channel, int channels, int frameBytes) {
    return In::Read(frame + static_cast<std::int64_t>(channel) * frameBytes / channels);
}

template <typename In>
bool IsFinite(const char* in, int frames, int channels, int frameBytes) {
    if (frameBytes == channels * In::kBytes)
        return Corvo::AllFinite(reinterpret_cast<const typename In::Value*>(in),
                                static_cast<std::size_t>(frames) * static_cast<std::size_t>(channels));
    bool finite = true;
    for (int i = 0; i < frames; ++i, in += frameBytes)
        for (int channel = 0; channel < channels; ++channel)
            finite &= std::isfinite(ReadAt<In>(in, channel, channels, frameBytes));
    return finite;
}

// Converts a copy in which samples that are not finite are 0.
template <typename In, typename Out>
int ConvertRepaired(SamplingFrequencyConverter& c, int frames, const char* in, char* out, int channels,
                    int inFrameBytes, int outFrameBytes, CDither<double>* dither) {
    constexpr int kPiece = 16;
    std::array<typename In::Value, kPiece * SamplingFrequencyConverter::kMaxChannels> copy;
    int written = 0;
    for (int count; frames > 0; frames -= count) {
        count = std::min(frames, kPiece);
        auto* to = copy.data();
        for (int i = 0; i < count; ++i, in += inFrameBytes)
            for (int channel = 0; channel < channels; ++channel)
                *to++ = static_cast<typename In::Value>(ReadAt<In>(in, channel, channels, inFrameBytes));
        Corvo::ReplaceNonFinite(copy.data(), count, channels);
        written +=
            c.sfreq_conversion_core_block<In, Out>(count, reinterpret_cast<char*>(copy.data()),
                                                   out + static_cast<std::ptrdiff_t>(written) * outFrameBytes,
                                                   channels, channels * In::kBytes, outFrameBytes, dither);
    }
    return written;
}

// A channel that samples near the largest number drove beyond it starts afresh: its histories are empty.
void ClearUnlessFinite(SamplingFrequencyConverter& c, int channel) {
    constexpr int kGroup = SamplingFrequencyConverter::kChannelsPerGroup;
    double sum = 0.0;
    for (const auto& state : c.pairStates[channel / kGroup]) sum += state[channel % kGroup];
    if (std::isfinite(sum)) return;
    std::ranges::fill(c.inputHistory[channel], 0.0);
    std::ranges::fill(c.outputHistory[channel], 0.0);
}

}  // namespace

SamplingFrequencyConverter::SamplingFrequencyConverter() = default;
SamplingFrequencyConverter::~SamplingFrequencyConverter() = default;
SamplingFrequencyConverter::SamplingFrequencyConverter(const SamplingFrequencyConverter& other) = default;
SamplingFrequencyConverter& SamplingFrequencyConverter::operator=(const SamplingFrequencyConverter& other) =
    default;

int SamplingFrequencyConverter::InitConversion(int inRate, int outRate) {
    constexpr int kLargest = 49;
    constexpr double kCloseEnough = 0.001;
    if (inRate == outRate || inRate < 1 || outRate < 1) return 0;
    const double ratio = static_cast<double>(outRate) / inRate;
    double best = 9999.0;
    int bestUp = 0, bestDown = 0;
    for (int u = 1; u <= kLargest && best >= kCloseEnough; ++u)
        for (int d = 1; d <= kLargest && best >= kCloseEnough; ++d) {
            const double error = std::abs(static_cast<double>(u) / d - ratio);
            if (error >= best) continue;
            best = error;
            bestUp = u;
            bestDown = d;
        }
    return InitConversionByFactors(bestUp, bestDown);
}

int SamplingFrequencyConverter::InitConversionByFactors(int upFactor, int downFactor) {
    if (upFactor < 1 || downFactor < 1 || std::max(upFactor, downFactor) > kMaxFactor) return 0;
    constexpr double kCutoff = 0.455;  // of the lower rate
    std::shared_ptr<const PolePairLowPass> designed;
    try {
        designed = std::make_shared<const PolePairLowPass>(
            upFactor, kCutoff * std::min(1.0 / upFactor, 1.0 / downFactor));
    } catch (const std::bad_alloc&) {
        return 0;
    }
    pairs = std::move(designed);
    up = upFactor;
    down = downFactor;
    lowPass = {};
    lowPass.poles = lowPass.zeros = kOrder;
    lowPass.gain = pairs->gain;
    double binomial = 1.0;
    for (int i = 0; i <= kOrder; binomial = binomial * (kOrder - i) / (i + 1), ++i)
        lowPass.feedForward[i] = binomial;
    std::ranges::copy(pairs->feedback, lowPass.feedback);
    ClearFirstChannels();
    return 1;
}

// The other channels go on with what they hold.
void SamplingFrequencyConverter::ClearFirstChannels() {
    for (int channel = 0; channel < 2; ++channel) {
        std::ranges::fill(inputHistory[channel], 0.0);
        std::ranges::fill(outputHistory[channel], 0.0);
        for (auto& value : pairStates[channel / kChannelsPerGroup]) value[channel % kChannelsPerGroup] = 0.0;
    }
}

void SamplingFrequencyConverter::StartStream() {
    ringLength = 10 * std::max(up, down);
    writePosition = readPosition = writeWraps = readWraps = 0;
}

void SamplingFrequencyConverter::Init(int channels) {
    StartStream();
    ringCapacity = ringLength;
    for (int channel = 0; channel < kMaxChannels; ++channel)
        rings[channel] =
            channel < channels ? new (std::nothrow) double[static_cast<std::size_t>(ringLength)]() : nullptr;
}

bool SamplingFrequencyConverter::Restart(const SamplingFrequencyConverter& design) {
    if (!design.pairs || 10 * std::max(design.up, design.down) > ringCapacity) return false;
    up = design.up;
    down = design.down;
    lowPass = design.lowPass;
    pairs = design.pairs;
    ClearFirstChannels();
    StartStream();
    return true;
}

void SamplingFrequencyConverter::FreeRings() {
    for (auto& ring : rings) {
        delete[] ring;
        ring = nullptr;
    }
}

double SamplingFrequencyConverter::GroupDelay() const { return pairs ? pairs->groupDelay : 0.0; }

double SamplingFrequencyConverter::sfreq_conv_lowpass(double x, double* xHistory, double* yHistory) {
    if (!std::isfinite(x)) x = 0.0;
    std::shift_left(xHistory, xHistory + lowPass.zeros + 1, 1);
    xHistory[lowPass.zeros] = x / lowPass.gain;
    std::shift_left(yHistory, yHistory + lowPass.poles + 1, 1);
    yHistory[lowPass.poles] = 0.0;
    double y = 0.0;
    for (int i = 0; i <= lowPass.zeros; ++i) y += xHistory[i] * lowPass.feedForward[i];
    for (int i = 0; i < lowPass.poles; ++i) y += yHistory[i] * lowPass.feedback[i];
    yHistory[lowPass.poles] = y;
    return y;
}

template <typename In, typename Out>
int SamplingFrequencyConverter::sfreq_conversion_core_block(int frames, char* in, char* out, int channels,
                                                            int inFrameBytes, int outFrameBytes,
                                                            CDither<double>* dither) {
    if (frames < 1 || channels < 1 || channels > kMaxChannels || !pairs || ringLength < 1) return 0;
    if (std::any_of(rings, rings + channels, [](const double* ring) { return ring == nullptr; })) return 0;
    const Corvo::DenormalGuard guard;
    if constexpr (requires { typename In::Value; })
        if (!IsFinite<In>(in, frames, channels, inFrameBytes))
            return ConvertRepaired<In, Out>(*this, frames, in, out, channels, inFrameBytes, outFrameBytes,
                                            dither);

    const std::int64_t toNextOutput = std::max<std::int64_t>(
        0, static_cast<std::int64_t>(readWraps - writeWraps) * ringLength + readPosition - writePosition);
    const auto block = [&](int channel, CDither<double>* ownDither) {
        const auto at = [&](auto* frame, int c, int stride) {
            return frame + static_cast<std::int64_t>(std::min(c, channels - 1)) * stride / channels;
        };
        return Block{frames,
                     {at(in, channel, inFrameBytes), at(in, channel + 1, inFrameBytes)},
                     {at(out, channel, outFrameBytes), at(out, channel + 1, outFrameBytes)},
                     inFrameBytes,
                     outFrameBytes,
                     ownDither};
    };
    // Dither draws its random numbers channel by channel, so then no two channels run together.
    const bool dithered =
        dither && std::any_of(dither, dither + channels, [](const auto& d) { return d.enabled; });
    int written = 0;
    for (int channel = 0; channel < channels;) {
        if (!dithered && channel + 1 < channels) {
            written = ConvertGroup<In, Out, 2>(*this, channel, block(channel, nullptr), toNextOutput);
            channel += 2;
        } else {
            written = ConvertGroup<In, Out, 1>(
                *this, channel, block(channel, dithered ? dither + channel : nullptr), toNextOutput);
            ++channel;
        }
    }
    for (int channel = 0; channel < channels; ++channel) ClearUnlessFinite(*this, channel);
    writeWraps += Advance(writePosition, static_cast<std::int64_t>(frames) * up, ringLength);
    readWraps += Advance(readPosition, static_cast<std::int64_t>(written) * down, ringLength);
    const int common = std::min(writeWraps, readWraps);
    writeWraps -= common;
    readWraps -= common;
    return written;
}

// clang-format off
#define CONVERT(In, Out)                                                                                  \
    template DSP_API int SamplingFrequencyConverter::sfreq_conversion_core_block<In, Out>(int, char*,     \
        char*, int, int, int, CDither<double>*);
#define CONVERT_TO_ALL(In)                                                                                \
    CONVERT(In, tipo_16bit_outd) CONVERT(In, tipo_24bit_outd)                                             \
    CONVERT(In, tipo_floatbit_outd) CONVERT(In, tipo_doublebit_outd)
CONVERT_TO_ALL(tipo_16bit)
CONVERT_TO_ALL(tipo_24bit)
CONVERT_TO_ALL(tipo_floatbit)
CONVERT_TO_ALL(tipo_doublebit)
// clang-format on
