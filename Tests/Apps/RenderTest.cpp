#include <gtest/gtest.h>

#include <chrono>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "Apps/Program.h"
#include "AudioReader.h"
#include "AudioWriter.h"
#include "Chain.h"
#include "DSP/Effects/Tremolo/Autovol.h"
#include "EffectElement.h"
#include "Relay.h"
#include "Render.h"

// Rendering with elements made for the purpose: what happens to time, whatever the effects are.
namespace AppTest {
namespace {

using dsphost::AutomationPoint;

// Delays by `latency` frames and announces it; adds an echo at half the level `echo` frames later; multiplies
// by the automated gain at the frame that the points name.
class Model : public dsphost::ChainElement {
public:
    Model(int latency, std::size_t echo = 0, double level = 0.5)
        : m_latency(latency), m_level(level), m_echo(echo), m_line(static_cast<std::size_t>(latency)) {}

    std::string Name() const override { return "Model"; }
    bool Prepare(int, const tWAVEFORMATEX& format, bool) override {
        EXPECT_EQ(format.nChannels, 1);
        return false;
    }
    int Latency() override { return m_latency; }
    double LongestGap() override { return static_cast<double>(m_echo) / kRate; }
    std::vector<int> AutomationLanes(std::string_view) override { return {0}; }
    void Automate(int, std::span<const AutomationPoint> points) override {
        m_points.assign(points.begin(), points.end());
    }
    // As an effect plays its envelope: what is due at the start holds for the whole block.
    void Process(double* samples, int frames, std::int64_t time) override {
        double gain = 1.0;
        for (const auto& point : m_points)
            if (point.frame <= time) gain = point.value;
        for (int i = 0; i < frames; ++i) {
            m_line.push_back(samples[i] * gain);
            const std::size_t at = m_line.size() - 1 - static_cast<std::size_t>(m_latency);
            samples[i] = m_line[at] + (m_echo > 0 && at >= m_echo ? m_level * m_line[at - m_echo] : 0.0);
        }
    }

    static constexpr int kRate = 48000;

private:
    int m_latency;
    double m_level;
    std::size_t m_echo;
    std::vector<double> m_line;
    std::vector<AutomationPoint> m_points;
};

class Rendering : public Program {
protected:
    static std::vector<std::unique_ptr<dsphost::ChainElement>> Models(std::vector<Model> models) {
        std::vector<std::unique_ptr<dsphost::ChainElement>> all;
        for (auto& model : models) all.push_back(std::make_unique<Model>(std::move(model)));
        return all;
    }

    std::vector<double> Render(const std::vector<double>& input, dsphost::Chain& chain,
                               const dsphost::RenderOptions& options) {
        Save("in.wav", {1, Model::kRate, kDouble, input});
        dsphost::AudioReader reader("in.wav");
        chain.Prepare(options.block, dsphost::ChainFormat(1, Model::kRate, options.precision),
                      options.planar);
        dsphost::AudioWriter writer("out.wav", {true, {}}, {1, Model::kRate, {}, reader.Format(), {}});
        dsphost::Render(reader, chain, writer, options, [](std::int64_t) {});
        writer.Commit();
        return Load("out.wav").samples;
    }
};

// The output lines up with the input whatever the latency, and points are met to the frame in both elements,
// though the second hears everything 300 frames late.
TEST_F(Rendering, LinesUpAndAutomatesToTheFrame) {
    const auto input = NoiseSound(1000, 1).samples;
    for (const int block : {1, 7, 999, 4096}) {
        dsphost::Chain chain(Models({{300}, {50}, {2000}}));
        chain.Automate(0, 0, std::vector<AutomationPoint>{{0, 1.0f}, {123, 0.5f}, {700, 0.25f}});
        chain.Automate(1, 0, std::vector<AutomationPoint>{{0, 1.0f}, {456, 0.125f}});
        const auto output = Render(input, chain, {.block = block});
        EXPECT_EQ(chain.Latency(), 2350);
        ASSERT_EQ(output.size(), input.size());
        for (std::size_t i = 0; i < output.size(); ++i) {
            const double gain = (i < 123 ? 1.0 : i < 700 ? 0.5 : 0.25) * (i < 456 ? 1.0 : 0.125);
            ASSERT_EQ(output[i], input[i] * gain) << i;
        }
    }
}

int g_sets = 0;

class CountingTremolo : public Corvo::DSP::Autovol {
public:
    void SetParam(int index, float normalised, bool fromAutomation) override {
        ++g_sets;
        Autovol::SetParam(index, normalised, fromAutomation);
    }
};

// Of twenty thousand points each is set once.
TEST_F(Rendering, PlaysEveryPointOnce) {
    std::vector<AutomationPoint> points;
    for (int i = 0; i < 20000; ++i) points.push_back({12 * i, static_cast<float>(i % 7) / 7.0f});
    const dsphost::EffectKind kind{
        "Tremolo", []() -> std::unique_ptr<dsphost::Effect> { return std::make_unique<CountingTremolo>(); }};
    dsphost::EffectElement tremolo(kind, "");
    tremolo.Automate(tremolo.AutomationLanes("Depth L")[0], points);
    tremolo.Prepare(12, dsphost::ChainFormat(1, Model::kRate, 64), false);
    std::vector<double> block(12, 0.5);
    for (int i = 0; i < 20000; ++i) {
        g_sets = 0;
        tremolo.Process(block.data(), 12, 12 * i);
        ASSERT_EQ(g_sets, 1) << i;
    }
}

TEST_F(Rendering, CutsTheTailWhereToldOrWhereItHasDied) {
    std::vector<double> input(1000);
    input[990] = 1.0;
    const auto frames = [&](std::size_t echo, double level, std::optional<double> tail) {
        dsphost::Chain chain(Models({{77, echo, level}}));
        return Render(input, chain, {.tail = tail}).size();
    };
    EXPECT_EQ(frames(48000, 0.5, 0.0), 1000u);
    EXPECT_EQ(frames(48000, 0.5, 0.25), 13000u);
    // The echo comes long after half a second of silence, and nothing is written behind it.
    EXPECT_EQ(frames(200000, 0.5, {}), 990u + 200000 + 1);
    EXPECT_EQ(frames(200000, 1.1e-6, {}), 990u + 200000 + 1);
    EXPECT_EQ(frames(200000, 0.9e-6, {}), 1000u);
    // Nothing rings for longer than a minute.
    EXPECT_EQ(frames(60 * 48000 + 11, 0.5, {}), 1000u);
    EXPECT_EQ(frames(60 * 48000 + 9, 0.5, {}), 60u * 48000 + 1000);
}

void Fill(dsphost::Relay& relay) {
    while (relay.ToFill()) relay.Pass();
}

// Whoever fills must not wait for a thread that has failed, nor the relay's end for one that has no more to
// do.
TEST(Relay, LeavesNobodyWaiting) {
    dsphost::Relay full(1);
    full.Start([&] {
        for (int i = 0; i < 3 && full.ToTake(); ++i) full.Return();
        throw std::runtime_error("disk full");
    });
    EXPECT_THROW(Fill(full), std::runtime_error);
    EXPECT_THROW(full.Finish(), std::runtime_error);

    dsphost::Relay taker(1), filler(1);
    taker.Start([&] { EXPECT_FALSE(taker.ToTake()); });
    filler.Start([&] { Fill(filler); });
}

// Each side runs dry or full while the other sleeps, and must be woken in the middle of the stream.
TEST(Relay, KeepsTheOrderWhileEitherSideSleepsNowAndThen) {
    const auto doze = [](int block, int when) {
        if (block % 100 == when) std::this_thread::sleep_for(std::chrono::milliseconds(1));
    };
    dsphost::Relay relay(1);
    int taken = 0;
    relay.Start([&] {
        for (; const auto* block = relay.ToTake(); ++taken, relay.Return()) {
            EXPECT_EQ(block->samples[0], taken);
            doze(taken, 0);
        }
    });
    for (int i = 0; i < 1000; ++i, relay.Pass()) {
        relay.ToFill()->samples[0] = i;
        doze(i, 50);
    }
    relay.Finish();
    EXPECT_EQ(taken, 1000);
}

}  // namespace
}  // namespace AppTest
