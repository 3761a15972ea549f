#include <algorithm>
#include <cmath>
#include <thread>

#include "Checks.h"
#include "Support/Signals.h"

namespace PluginHost {
namespace {
thread_local Thread t_thread = Thread::Main;
}

Thread CurrentThread() { return t_thread; }

void OnAudioThread(const std::function<void()>& work) {
    if (t_thread == Thread::Audio) return work();
    std::thread([&] {
        t_thread = Thread::Audio;
        work();
    }).join();
}

std::int64_t Stream::Read(void* buffer, std::int64_t size) {
    const auto count = std::min({static_cast<std::size_t>(size), most, bytes.size() - position});
    std::copy_n(bytes.data() + position, count, static_cast<char*>(buffer));
    position += count;
    return static_cast<std::int64_t>(count);
}

std::int64_t Stream::Write(const void* buffer, std::int64_t size) {
    const auto count = std::min(static_cast<std::size_t>(size), most);
    const char* const from = static_cast<const char*>(buffer);
    bytes.insert(bytes.end(), from, from + count);
    return static_cast<std::int64_t>(count);
}

double Parameter::At(double part) const {
    const double place = steps > 0 ? std::round(part * steps) / steps : part;
    return minimum + place * (maximum - minimum);
}

int Channels(const std::vector<Port>& ports) {
    int channels = 0;
    for (const Port& port : ports) channels += port.channels;
    return channels;
}

Signal Noise(const Instance& plugin, std::size_t frames, float level, unsigned seed) {
    Signal signal;
    for (int c = 0; c < Channels(plugin.inputs); ++c)
        signal.push_back(TestSupport::Noise<float>(frames, level, seed + 100 * static_cast<unsigned>(c)));
    return signal;
}

Signal Render(Instance& plugin, const Signal& input, const Way& way) {
    const std::size_t frames = input.at(0).size();
    Signal in = input;
    Signal out(static_cast<std::size_t>(Channels(plugin.outputs)), std::vector<float>(frames, 99.0f));
    std::vector<float*> ins(in.size()), outs(out.size());
    std::vector<Change> changes;
    std::mt19937 random(7);
    std::size_t next = 0;
    bool failed = false;
    OnAudioThread([&] {
        for (std::size_t at = 0; at < frames;) {
            const std::uint32_t wanted =
                way.mixed ? static_cast<std::uint32_t>(random() % (way.block + 1)) : way.block;
            const std::size_t count = std::min<std::size_t>(wanted, frames - at);
            for (std::size_t c = 0; c < ins.size(); ++c) ins[c] = in[c].data() + at;
            for (std::size_t c = 0; c < outs.size(); ++c)
                outs[c] = way.inPlace && c < ins.size() ? ins[c] : out[c].data() + at;
            changes.clear();
            for (; next < way.changes.size() && way.changes[next].frame < at + count; ++next) {
                changes.push_back(way.changes[next]);
                changes.back().frame -= static_cast<std::uint32_t>(at);
            }
            failed |= !plugin.Process({ins, outs, static_cast<std::uint32_t>(count), changes});
            at += count;
        }
    });
    Expect(!failed, "process fails");
    if (way.inPlace) std::copy_n(in.begin(), std::min(in.size(), out.size()), out.begin());
    return out;
}

Signal RenderAt(Instance& plugin, double rate, const Signal& input, const Way& way) {
    Expect(plugin.Activate(rate, way.block), "cannot be activated at " + std::to_string(rate) + " Hz");
    Signal output = Render(plugin, input, way);
    plugin.Deactivate();
    return output;
}

bool IsFinite(const Signal& signal) {
    return std::ranges::all_of(signal, [](const auto& channel) { return TestSupport::AllFinite(channel); });
}

double LargestDifference(const Signal& a, const Signal& b) {
    double largest = 0;
    for (std::size_t c = 0; c < a.size(); ++c)
        for (std::size_t i = 0; i < a[c].size(); ++i) {
            const double difference = std::abs(static_cast<double>(a[c][i]) - b[c][i]);
            if (!(difference <= largest)) largest = difference;
        }
    return largest;
}

bool AlwaysAlike(PluginFile& file, std::size_t index, const Signal& one, const Signal& other, double tempo) {
    const auto first = file.Create(index), second = file.Create(index);
    second->tempo = tempo;
    std::mt19937 random(2);
    for (int round = 0; round < 20; ++round) {
        const auto changes = ForAll(*first, [&] { return Share(random); });
        if (LargestDifference(RenderAt(*first, 48000, one, {.changes = changes}),
                              RenderAt(*second, 48000, other, {.changes = changes})) >= 1e-4)
            return false;
    }
    return true;
}

}  // namespace PluginHost
