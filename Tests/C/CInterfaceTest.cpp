#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <tuple>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "C/dspdll.h"
#if defined(DSP_TEST_DRAWS)
#include "C/dspdrawing.h"
#endif
#include "DSP/Effects/EffectKinds.h"
#include "Support/Signals.h"
#include "Support/TwoThreads.h"

namespace {

using Corvo::DSP::CorvoEffectBase;

// One handle of every kind, and one that was closed.
class Handles {
public:
    Handles() {
        const dsp_conversion conversion{sizeof(dsp_conversion), 48000, 44100, 1, DSP_F64, DSP_F64, 0, 0};
        const dsp_shift shift{sizeof(dsp_shift), 48000, 1, DSP_ENGINE_NEW, 0, 0, 1.0, 1.0};
        const dsp_format format{sizeof(dsp_format), 48000, 2, DSP_F32, 16};
        dsp_effect* gone = nullptr;
        std::vector statuses{dsp_effect_create("Echo", &Right<dsp_effect>(), nullptr),
                             dsp_equaliser_create(&Right<dsp_equaliser>(), nullptr),
                             dsp_converter_create(&conversion, &Right<dsp_converter>(), nullptr),
                             dsp_pitch_shift_create(&shift, &Right<dsp_pitch_shift>(), nullptr),
                             dsp_transform_create(16, 0, &Right<dsp_transform>(), nullptr),
                             dsp_analyser_create(48000, &Right<dsp_analyser>(), nullptr),
                             dsp_effect_prepare(Right<dsp_effect>(), &format, nullptr),
                             dsp_effect_create("Gain", &gone, nullptr),
                             dsp_close(gone)};
#if defined(DSP_TEST_DRAWS)
        statuses.push_back(dsp_drawing_create(&Right<dsp_drawing>(), nullptr));
#endif
        EXPECT_EQ(statuses, std::vector<dsp_status>(statuses.size(), DSP_OK));
        closed = gone;
    }
    ~Handles() {
        std::apply([](auto*... handles) { (dsp_close(handles), ...); }, m_all);
    }

    template <typename Handle>
    Handle*& Right() {
        return std::get<Handle*>(m_all);
    }
    template <typename Handle>
    Handle* Other() {
        if constexpr (std::is_same_v<Handle, dsp_effect>)
            return static_cast<Handle*>(static_cast<void*>(Right<dsp_transform>()));
        else
            return static_cast<Handle*>(static_cast<void*>(Right<dsp_effect>()));
    }

    void* closed = nullptr;

private:
    std::tuple<dsp_effect*, dsp_equaliser*, dsp_converter*, dsp_pitch_shift*, dsp_transform*, dsp_analyser*
#if defined(DSP_TEST_DRAWS)
               ,
               dsp_drawing*
#endif
               >
        m_all{};
};

template <typename T, typename = void>
constexpr bool kIsHandle = !std::is_void_v<T> && !std::is_function_v<T>;
template <typename T>
constexpr bool kIsHandle<T, std::void_t<decltype(sizeof(T))>> = false;

// Memory that arguments may point to: zeros; records of any kind whose size is set, with zeros and with huge
// numbers behind it; channels.
struct Memory {
    static constexpr std::size_t kRecord = 1024;

    void Fill() {
        std::memset(zeros, 0, sizeof zeros);
        std::memset(small, 0, sizeof small);
        std::memset(huge, 0x7F, sizeof huge);
        const std::uint32_t size = kRecord;
        for (auto* const record : {small, huge}) std::memcpy(record, &size, sizeof size);
        for (auto& channel : channels) channel = zeros;
    }

    alignas(16) std::byte zeros[65536], small[kRecord], huge[kRecord];
    void* channels[2];
};

// What is tried for an argument. A count that is larger than the memory goes with null pointers only.
template <typename T>
std::vector<T> Candidates(Handles& handles, Memory& memory, bool huge) {
    if constexpr (std::is_pointer_v<T>) {
        using Target = std::remove_const_t<std::remove_pointer_t<T>>;
        if constexpr (std::is_function_v<Target>)
            return {nullptr};
        else if constexpr (kIsHandle<Target>)
            return {nullptr, static_cast<T>(handles.closed), handles.Other<Target>(),
                    handles.Right<Target>()};
        else if (huge)
            return {nullptr};
        else if constexpr (std::is_pointer_v<Target> && !kIsHandle<std::remove_pointer_t<Target>>)
            return {nullptr, reinterpret_cast<T>(memory.zeros), reinterpret_cast<T>(memory.channels)};
        else if constexpr (std::is_class_v<Target>)
            return {nullptr, reinterpret_cast<T>(memory.zeros), reinterpret_cast<T>(memory.small),
                    reinterpret_cast<T>(memory.huge)};
        else
            return {nullptr, static_cast<T>(static_cast<void*>(memory.zeros))};
    } else if constexpr (std::is_floating_point_v<T>) {
        return {T(0), T(-1e30)};
    } else if (huge) {
        return {std::numeric_limits<T>::max(), std::numeric_limits<T>::min()};
    } else {
        return {T(0), T(1), T(-1) < T(0) ? T(-1) : T(2)};
    }
}

// Calls with every combination of what is tried for each argument.
template <typename... Arguments, typename... Chosen>
void CallWithAll(dsp_status(DSP_CALL* function)(Arguments...), Handles& handles, Memory& memory, bool huge,
                 const auto& check, Chosen... chosen) {
    if constexpr (sizeof...(Chosen) == sizeof...(Arguments)) {
        memory.Fill();
        check(function(chosen...), chosen...);
        // What was created goes: analysers that are left would slow every other one down.
        void* made = nullptr;
        std::memcpy(&made, memory.zeros, sizeof made);
        dsp_close(made);
    } else {
        using T = std::tuple_element_t<sizeof...(Chosen), std::tuple<Arguments...>>;
        for (const T value : Candidates<T>(handles, memory, huge))
            CallWithAll(function, handles, memory, huge, check, chosen..., value);
    }
}

// What each function says to nulls, zeros, huge counts and handles of other kinds.
template <typename First, typename... Arguments>
void TryEverything(const char* name, dsp_status(DSP_CALL* function)(First, Arguments...)) {
    Handles handles;
    Memory memory;
    const auto check = [&](dsp_status status, First first, auto...) {
        ASSERT_TRUE(status >= DSP_OK && status <= DSP_FAILED) << name;
        if constexpr (kIsHandle<std::remove_pointer_t<First>>) {
            const auto* const other = handles.Other<std::remove_pointer_t<First>>();
            const dsp_status expected = !first                    ? DSP_NULL
                                        : first == handles.closed ? DSP_CLOSED
                                        : first == other          ? DSP_OTHER_KIND
                                                                  : status;
            ASSERT_EQ(status, expected) << name;
        }
    };
    for (const bool huge : {false, true}) CallWithAll(function, handles, memory, huge, check);
}
template <typename Number>
void TryEverything(const char* name, Number(DSP_CALL* ask)()) {
    ASSERT_GE(static_cast<int>(ask()), DSP_OK) << name;
}
void TryEverything(const char* name, const char*(DSP_CALL* text)(dsp_status)) {
    for (dsp_status status = -1; status <= DSP_FAILED + 1; ++status) ASSERT_NE(text(status), nullptr) << name;
}

TEST(CInterface, TakesNullsHugeCountsAndForeignHandlesWithAStatus) {
#define FUNCTION(name) TryEverything(#name, name);
#include "functions.inc"
#undef FUNCTION
}

// The same bytes as the classes give, in blocks that are longer than the longest piece and cut by automation.
TEST(CInterface, ProcessesLikeTheClasses) {
    constexpr int kFrames = 12000, kMost = 256, kPoint = 700, kRate = 48000;
    const auto wave = TestSupport::Format<double>(2, kRate);
    const dsp_format format{sizeof(dsp_format), kRate, 2, DSP_F64, kMost};
    const auto noise = TestSupport::Noise<double>(2 * kFrames);
    for (const auto& kind : Corvo::DSP::EffectKinds()) {
        SCOPED_TRACE(kind.name);
        const auto direct = kind.MakeReady();
        ASSERT_EQ(direct->GetName(), kind.name);
        direct->SetParam(0, 0.25f, false);
        const bool automates = direct->PlaysAutomation();
        direct->InitProcessing(kMost, &wave);
        auto expected = noise;
        for (int at = 0; at < kFrames;) {
            const int toPoint = automates && at < kPoint ? kPoint - at : kMost;
            const int toBlock = at < 1000 ? 1000 - at : kFrames - at;
            const int count = std::min({kMost, toPoint, toBlock});
            Corvo::DSP::ProcessFlags flags;
            if (automates && at == kPoint) direct->SetParam(0, 0.75f, true);
            direct->Process(&expected[2 * static_cast<std::size_t>(at)], count, &wave, flags);
            at += count;
        }

        EXPECT_NE(expected, std::vector<double>(expected.size())) << "silence";
        for (const bool planar : {false, true}) {
            dsp_effect* effect = nullptr;
            const dsp_point points[]{{0, 0.25f, 0.0f}, {kPoint, 0.75f, 0.0f}};
            ASSERT_EQ(dsp_effect_create(kind.name, &effect, nullptr), DSP_OK);
            ASSERT_EQ(dsp_effect_set(effect, 0, 0.25f), DSP_OK);
            ASSERT_EQ(dsp_effect_automate(effect, 0, points, 2), automates ? DSP_OK : DSP_UNSUPPORTED);
            ASSERT_EQ(dsp_effect_prepare(effect, &format, nullptr), DSP_OK);
            auto got = noise;
            for (const int at : {0, 1000}) {
                const int count = at ? kFrames - at : 1000;
                double* const block = &got[2 * static_cast<std::size_t>(at)];
                if (!planar) {
                    ASSERT_EQ(dsp_effect_process_f64(effect, block, count), DSP_OK);
                    continue;
                }
                const std::vector<double> both(block, block + 2 * count);
                auto left = TestSupport::Channel(both, 0), right = TestSupport::Channel(both, 1);
                double* const channels[]{left.data(), right.data()};
                ASSERT_EQ(dsp_effect_process_planar_f64(effect, channels, count), DSP_OK);
                for (int i = 0; i < 2 * count; ++i) block[i] = channels[i % 2][i / 2];
            }
            EXPECT_EQ(dsp_close(effect), DSP_OK);
            EXPECT_EQ(std::memcmp(got.data(), expected.data(), sizeof(double) * got.size()), 0)
                << (planar ? "planar" : "interleaved");
        }
    }
}

// Catches races between the two threads of every object, and with the table of handles (under the thread
// sanitizer), and statuses that depend on what the other thread does.
TEST(CInterface, IsEditedAndAskedWhileItProcesses) {
    const dsp_format format{sizeof(dsp_format), 8000, 2, DSP_F32, 64};
    const auto ok = [](dsp_status status) { EXPECT_EQ(status, DSP_OK); };
    for (const auto& kind : Corvo::DSP::EffectKinds()) {
        SCOPED_TRACE(kind.name);
        dsp_effect* effect = nullptr;
        dsp_analyser* analyser = nullptr;
        ok(dsp_effect_create(kind.name, &effect, nullptr));
        ok(dsp_analyser_create(8000, &analyser, nullptr));
        ok(dsp_effect_prepare(effect, &format, nullptr));
        const auto audio = [&](int block) {
            auto samples = TestSupport::Noise<float>(2 * 100);
            ok(dsp_effect_process_f32(effect, samples.data(), 100));
            ok(dsp_analyser_feed_f32(analyser, samples.data(), 100, 2));
            ok(block % 7 == 0 ? dsp_effect_rewind(effect, 0) : DSP_OK);
        };
        const auto edit = [&] {
            std::vector<std::byte> state(1 << 20);
            int32_t parameters = 0, presets = 0, latency = 0;
            std::size_t needed = 0;
            char text[200];
            ok(dsp_effect_parameters(effect, &parameters));
            ok(dsp_effect_presets(effect, &presets));
            for (int round = 0; round < 10; ++round) {
                dsp_effect* other = nullptr;
                ok(dsp_effect_create("Gain", &other, nullptr));
                for (int32_t p = 0; p < parameters; ++p) {
                    ok(dsp_effect_set(effect, p, static_cast<float>((p + round) % 11) / 10.0f));
                    ok(dsp_effect_parameter_text(effect, p, DSP_TEXT_VALUE, text, sizeof text, nullptr));
                }
                ok(dsp_effect_latency(effect, &latency));
                ok(dsp_effect_state(effect, state.data(), state.size(), &needed));
                ok(dsp_effect_set_state(effect, state.data(), needed, nullptr));
                ok(presets > 0 ? dsp_effect_set_preset(effect, round % presets) : DSP_OK);
                ok(dsp_analyser_refresh(analyser, nullptr));
                ok(dsp_close(other));
            }
        };
        TestSupport::WhileAnotherThread(audio, edit);
        ok(dsp_close(analyser));
        ok(dsp_close(effect));
    }
}

TEST(CInterface, CutsTextsAtWholeCharactersAndSaysWhatTheyNeed) {
    char buffer[8] = "?";
    std::size_t needed = 0;
    ASSERT_EQ(dsp_effect_kind_name(0, nullptr, 0, &needed), DSP_OK);
    const std::string name = Corvo::DSP::EffectKinds()[0].name;
    EXPECT_EQ(needed, name.size() + 1);
    EXPECT_EQ(dsp_effect_kind_name(0, buffer, 3, nullptr), DSP_TOO_SMALL);
    EXPECT_EQ(buffer, name.substr(0, 2));
    EXPECT_EQ(dsp_effect_kind_name(0, nullptr, 8, nullptr), DSP_NULL);
}

}  // namespace
