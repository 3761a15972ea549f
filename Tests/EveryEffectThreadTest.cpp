#include <gtest/gtest.h>

#include <chrono>
#include <mutex>
#include <thread>

#include "Support/AudioThreadRules.h"
#include "Support/EveryEffect.h"
#include "Support/TwoThreads.h"

using namespace TestSupport;

// What every effect promises about its two threads.

// Catches counters that see nothing, which would make the next test pass whatever an effect does.
TEST(AudioThreadRules, SeesWhatIsForbidden) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "no counters on this build";
    std::mutex mutex;
    std::unique_ptr<std::vector<int>> memory;
    const auto forbidden = [&] {
        memory = std::make_unique<std::vector<int>>(100);
        const std::lock_guard lock(mutex);
        std::this_thread::sleep_for(std::chrono::nanoseconds(1));
    };
    EXPECT_EQ(BrokenBy(forbidden), "2 allocations, 1 locks, 1 waits");
    EXPECT_EQ(BrokenBy([&] { memory.reset(); }), "2 frees");
}

// Catches work on the audio thread that may stop it: edits, presets, automation and forced cooks included.
TEST_P(EveryEffect, NeitherAllocatesNorLocksWhileProcessing) {
    if (!AudioThreadRules::CanCount()) GTEST_SKIP() << "no counters on this build";
    if (GetParam().engineAllocates) GTEST_SKIP() << GetParam().engineAllocates;
    const auto effect = Make();
    const auto format = Format<float>();
    const MP_ENVELOPE_SEGMENT segments[] = {{0, 0, 0.2f, 0.2f, MP_CURVE_JUMP, 0},
                                            {600, 600, 0.7f, 0.7f, MP_CURVE_JUMP, 0}};
    for (int index = 0; index < effect->GetParamCountReal(); index += 2)
        effect->AddEnvelope(index, 2, segments);
    effect->InitProcessing(256, &format);
    auto block = Noise<float>(2 * 256);
    Random random(11);
    const auto process = [&](const std::string& what, bool force) {
        Corvo::DSP::ProcessFlags flags{force, false};
        const auto broken = BrokenBy([&] {
            effect->Process(reinterpret_cast<double*>(block.data()), 256, &format, flags);
            if (force) effect->InitResetProcessingLight(true);
        });
        ASSERT_EQ(broken, "") << what;
        block = Noise<float>(2 * 256);
    };
    for (int round = 0; round < 100; ++round) {
        effect->SetEnvelopeTime(round * 256);
        if (round % 3 == 0) SetAllParams(*effect, random);
        if (round % 7 == 0 && effect->NumPresets() > 0) effect->SetPreset(random.Below(effect->NumPresets()));
        process("round " + std::to_string(round), round % 10 == 9);
    }
    for (int index = 0; index < effect->GetParamCount(); ++index)
        for (const float value : {0.0f, 1.0f, 0.5f}) {
            effect->SetParam(index, value, false);
            process("parameter " + std::to_string(index) + " at " + std::to_string(value), false);
        }
}

// Catches races between edits, automation and processing (under the thread sanitizer), and a hand-over that
// takes no more settings after many edits: the last ones must sound as they do in a new instance.
TEST_P(EveryEffect, TakesEditsFromAnotherThreadWhileItRuns) {
    const auto effect = Make();
    const auto format = Format<float>();
    const MP_ENVELOPE_SEGMENT segments[] = {{0, 0, 0.4f, 0.4f, MP_CURVE_JUMP, 0},
                                            {100, 100, 0.8f, 0.8f, MP_CURVE_JUMP, 0}};
    for (int index = 0; index < effect->GetParamCountReal(); index += 3)
        effect->AddEnvelope(index, 2, segments);
    effect->InitProcessing(32, &format);
    Random edits(13);
    const auto good = Chunk(*effect);
    const auto edit = [&](int round) {
        for (int index = 0; index < effect->GetParamCount(); ++index) {
            effect->SetParam(index, static_cast<float>(edits.Unit()), false);
            effect->GetParameterFormattedText(index, effect->GetParam(index));
            PluginParameterInfo info;
            effect->GetParamSectionInfo(index, info);
        }
        if (round % 5 == 0 && effect->NumPresets() > 0) effect->SetPreset(edits.Below(effect->NumPresets()));
        if (round % 7 == 0) effect->SetSettingsChunk(good);
        Chunk(*effect);
        if (effect->WantsUpdateUiFromScratch()) effect->SetUpdateUiFromScratch(false);
    };
    const auto input = Noise<float>(2 * 32);
    WhileAnotherThread(edit, [&] {
        for (int i = 0; i < 500; ++i) {
            auto block = input;
            effect->SetEnvelopeTime(i % 200);
            ProcessBlock(*effect, block.data(), 32, format);
        }
    });

    const auto donor = Make(), fresh = Make();
    SetAllParams(*donor, Random(17));
    if (const int off = GetParam().loadsOff; off >= 0) donor->SetParam(off, 0.0f, false);
    const auto settings = Chunk(*donor);
    std::vector<float> heard[2];
    for (std::size_t i = 0; auto* each : {effect.get(), fresh.get()}) {
        for (int index = 0; index < each->GetParamCountReal(); ++index) each->AddEnvelope(index, 0, nullptr);
        each->SetSettingsChunk(settings);
        EXPECT_EQ(Chunk(*each), settings);
        each->Cleanup();
        heard[i++] = Render(*each, Noise<float>(2 * 4800), format, {32});
    }
    if (!GetParam().phaseRunsOn) {
        EXPECT_EQ(heard[0], heard[1]);
    }
}
