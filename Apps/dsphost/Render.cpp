#include "Render.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <span>
#include <vector>

#include "File.h"

namespace dsphost {
namespace {

// Passes the output on while it is loud, and holds quiet stretches back until something loud follows them.
class TailGate {
public:
    TailGate(AudioWriter& output, int channels) : m_output(output), m_channels(channels) {}

    void Write(std::span<const double> samples) {
        const auto loud = [](double sample) { return !(std::abs(sample) < kTailThreshold); };
        const auto last = std::find_if(samples.rbegin(), samples.rend(), loud);
        const auto channels = static_cast<std::size_t>(m_channels);
        const auto loudSamples = static_cast<std::size_t>(samples.rend() - last);
        const std::size_t loudFrames = (loudSamples + channels - 1) / channels;
        if (loudFrames > 0) {
            m_output.Write(m_held.data(), static_cast<std::int64_t>(m_held.size() / channels));
            m_output.Write(samples.data(), static_cast<std::int64_t>(loudFrames));
            m_held.clear();
        }
        m_held.insert(m_held.end(), samples.begin() + static_cast<std::ptrdiff_t>(loudFrames * channels),
                      samples.end());
    }
    std::int64_t QuietFrames() const { return static_cast<std::int64_t>(m_held.size()) / m_channels; }

private:
    AudioWriter& m_output;
    int m_channels;
    std::vector<double> m_held;
};

class Renderer {
public:
    Renderer(AudioReader& input, Chain& chain, AudioWriter& output, const RenderOptions& options)
        : m_input(input),
          m_chain(chain),
          m_output(output),
          m_options(options),
          m_samples(static_cast<std::size_t>(options.block) * static_cast<std::size_t>(input.Channels())),
          m_narrow(options.precision == 32 ? m_samples.size() : 0),
          m_gate(output, input.Channels()) {}

    void Run(const std::function<void(std::int64_t)>& onProgress) {
        while (!Finished()) {
            const int frames = BlockFrames();
            ReadBlock(frames);
            ProcessBlock(frames);
            WriteBlock(frames);
            m_position += frames;
            onProgress(m_inputFrames ? *m_inputFrames : m_position);
        }
    }

private:
    std::int64_t Seconds(double seconds) const { return std::llround(seconds * m_input.Rate()); }
    // Output frames wanted at most; the input's length and the tail are known at its end only.
    std::int64_t OutputFrames() const {
        if (!m_inputFrames) return std::numeric_limits<std::int64_t>::max();
        return *m_inputFrames + Seconds(m_options.tail.value_or(kLongestAutoTail));
    }
    std::int64_t OutputPosition() const { return m_position - m_chain.Latency(); }
    bool Finished() const {
        return OutputPosition() >= OutputFrames() ||
               (m_quietEnough && m_gate.QuietFrames() >= *m_quietEnough);
    }
    int BlockFrames() const { return m_chain.FramesToCut(m_position, m_options.block); }

    // Silence follows the input's last frame.
    void ReadBlock(int frames) {
        const int got = m_inputFrames ? 0 : m_input.Read(m_samples.data(), frames);
        if (got < frames && !m_inputFrames) {
            m_inputFrames = m_position + got;
            if (!m_options.tail) m_quietEnough = Seconds(kTailQuietSeconds + m_chain.LongestGap());
        }
        std::fill(m_samples.begin() + static_cast<std::ptrdiff_t>(got) * m_input.Channels(), m_samples.end(),
                  0.0);
    }

    void ProcessBlock(int frames) {
        if (m_options.precision == 64) return m_chain.Process(m_samples.data(), frames, m_position);
        const std::size_t count = Samples(frames);
        std::transform(m_samples.begin(), m_samples.begin() + static_cast<std::ptrdiff_t>(count),
                       m_narrow.begin(), [](double sample) { return static_cast<float>(sample); });
        m_chain.Process(reinterpret_cast<double*>(m_narrow.data()), frames, m_position);
        std::copy_n(m_narrow.begin(), count, m_samples.begin());
    }

    void WriteBlock(int frames) {
        const std::int64_t start = OutputPosition();
        const std::int64_t begin = std::max<std::int64_t>(start, 0);
        const std::int64_t end = std::min(start + frames, OutputFrames());
        const std::int64_t body = m_inputFrames && !m_options.tail ? std::min(end, *m_inputFrames) : end;
        if (body > begin) m_output.Write(&m_samples[Samples(begin - start)], body - begin);
        const std::int64_t tail = std::max(begin, body);
        if (end > tail)
            m_gate.Write(std::span(m_samples).subspan(Samples(tail - start), Samples(end - tail)));
    }

    std::size_t Samples(std::int64_t frames) const {
        return static_cast<std::size_t>(frames * m_input.Channels());
    }

    AudioReader& m_input;
    Chain& m_chain;
    AudioWriter& m_output;
    const RenderOptions& m_options;
    std::vector<double> m_samples;
    std::vector<float> m_narrow;
    TailGate m_gate;
    std::int64_t m_position = 0;  // frames given to the chain
    // Known at the input's end; the second for an automatic tail only.
    std::optional<std::int64_t> m_inputFrames, m_quietEnough;
};

}  // namespace

tWAVEFORMATEX ChainFormat(int channels, int rate, int precision) {
    constexpr std::uint16_t kFloatTag = 3;
    tWAVEFORMATEX format{};
    format.wFormatTag = kFloatTag;
    format.nChannels = static_cast<std::uint16_t>(channels);
    format.nSamplesPerSec = static_cast<std::uint32_t>(rate);
    format.wBitsPerSample = static_cast<std::uint16_t>(precision);
    format.nBlockAlign = static_cast<std::uint16_t>(channels * precision / 8);
    format.nAvgBytesPerSec = format.nSamplesPerSec * format.nBlockAlign;
    return format;
}

void Render(AudioReader& input, Chain& chain, AudioWriter& output, const RenderOptions& options,
            const std::function<void(std::int64_t)>& onProgress) {
    Renderer(input, chain, output, options).Run(onProgress);
}

}  // namespace dsphost
