#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <map>
#include <string>
#include <thread>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "C/dspdll.h"
#if defined(DSP_TEST_DRAWS)
#include "C/dspdrawing.h"
#endif
#include "DSP/Effects/EffectKinds.h"
#include "Support/Signals.h"

namespace {

using Corvo::DSP::CorvoEffectBase;

// One handle of every kind, and one that was closed.
class Handles {
public:
    Handles() {
        const dsp_conversion conversion{sizeof(dsp_conversion), 48000, 44100, 1, DSP_F64, DSP_F64, 0, 0};
        const dsp_shift shift{sizeof(dsp_shift), 48000, 1, DSP_ENGINE_NEW, 0, 0, 1.0, 1.0};
        Add(dsp_effect_create("Echo", &effect, nullptr), effect);
        Add(dsp_equaliser_create(&equaliser, nullptr), equaliser);
        Add(dsp_converter_create(&conversion, &converter, nullptr), converter);
        Add(dsp_pitch_shift_create(&shift, &pitchShift, nullptr), pitchShift);
        Add(dsp_transform_create(16, 0, &transform, nullptr), transform);
        Add(dsp_analyser_create(48000, &analyser, nullptr), analyser);
#if defined(DSP_TEST_DRAWS)
        Add(dsp_drawing_create(&drawing, nullptr), drawing);
#endif
        const dsp_format format{sizeof(dsp_format), 48000, 2, DSP_F32, 16};
        EXPECT_EQ(dsp_effect_prepare(effect, &format, nullptr), DSP_OK);
        dsp_effect* gone = nullptr;
        EXPECT_EQ(dsp_effect_create("Gain", &gone, nullptr), DSP_OK);
        EXPECT_EQ(dsp_close(gone), DSP_OK);
        closed = gone;
    }
    ~Handles() {
        for (void* const handle : all) dsp_close(handle);
    }

    template <typename Handle>
    Handle* Right() {
        if constexpr (std::is_same_v<Handle, dsp_effect>) return effect;
        if constexpr (std::is_same_v<Handle, dsp_equaliser>) return equaliser;
        if constexpr (std::is_same_v<Handle, dsp_converter>) return converter;
        if constexpr (std::is_same_v<Handle, dsp_pitch_shift>) return pitchShift;
        if constexpr (std::is_same_v<Handle, dsp_transform>) return transform;
        if constexpr (std::is_same_v<Handle, dsp_analyser>) return analyser;
#if defined(DSP_TEST_DRAWS)
        if constexpr (std::is_same_v<Handle, dsp_drawing>) return drawing;
#endif
    }
    template <typename Handle>
    Handle* Other() {
        void* const other = std::is_same_v<Handle, dsp_effect> ? static_cast<void*>(transform) : effect;
        return static_cast<Handle*>(other);
    }

    void* closed = nullptr;

private:
    // By reference: by value the handle might be read before it is made.
    template <typename Handle>
    void Add(dsp_status status, Handle* const& handle) {
        EXPECT_EQ(status, DSP_OK);
        all.push_back(handle);
    }

    dsp_effect* effect = nullptr;
    dsp_equaliser* equaliser = nullptr;
    dsp_converter* converter = nullptr;
    dsp_pitch_shift* pitchShift = nullptr;
    dsp_transform* transform = nullptr;
    dsp_analyser* analyser = nullptr;
#if defined(DSP_TEST_DRAWS)
    dsp_drawing* drawing = nullptr;
#endif
    std::vector<void*> all;
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

// Calls with every combination of what is tried for each argument; the statuses by the first argument.
template <typename Status, typename... Arguments>
class Abuse {
public:
    using Function = Status(DSP_CALL*)(Arguments...);

    Abuse(Function function, Handles& handles) : m_function(function), m_handles(handles) {}

    template <typename Check>
    void Run(Check check) {
        for (const bool huge : {false, true}) Choose<0>(huge, std::tuple<>(), check);
    }

private:
    template <std::size_t i, typename Chosen, typename Check>
    void Choose(bool huge, const Chosen& chosen, Check& check) {
        if constexpr (i == sizeof...(Arguments)) {
            m_memory.Fill();
            check(chosen, std::apply(m_function, chosen));
            // What was created goes: analysers that are left would slow every other one down.
            void* made = nullptr;
            std::memcpy(&made, m_memory.zeros, sizeof made);
            dsp_close(made);
        } else {
            using T = std::tuple_element_t<i, std::tuple<Arguments...>>;
            for (const T value : Candidates<T>(m_handles, m_memory, huge))
                Choose<i + 1>(huge, std::tuple_cat(chosen, std::tuple(value)), check);
        }
    }

    Function m_function;
    Handles& m_handles;
    Memory m_memory;
};

// What each function says to nulls, zeros, huge counts and handles of other kinds.
template <typename... Arguments>
void TryEverything(const char* name, dsp_status(DSP_CALL* function)(Arguments...)) {
    Handles handles;
    Abuse<dsp_status, Arguments...>(function, handles).Run([&](const auto& arguments, dsp_status status) {
        ASSERT_GE(status, DSP_OK) << name;
        if constexpr (sizeof...(Arguments) > 0) {
            ASSERT_LE(status, DSP_FAILED) << name;
            using First = std::remove_pointer_t<std::tuple_element_t<0, std::tuple<Arguments...>>>;
            if constexpr (kIsHandle<First>) {
                const void* const handle = std::get<0>(arguments);
                const std::map<const void*, dsp_status> expected{{nullptr, DSP_NULL},
                                                                 {handles.closed, DSP_CLOSED},
                                                                 {handles.Other<First>(), DSP_OTHER_KIND}};
                if (const auto wrong = expected.find(handle); wrong != expected.end()) {
                    ASSERT_EQ(status, wrong->second) << name;
                }
            }
        }
    });
}
void TryEverything(const char*, uint32_t(DSP_CALL*)()) {}  // nothing to try
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
    tWAVEFORMATEX wave{};
    wave.nChannels = 2;
    wave.nSamplesPerSec = kRate;
    wave.wBitsPerSample = 64;
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
            for (const auto& [at, count] : {std::pair{0, 1000}, std::pair{1000, kFrames - 1000}}) {
                double* const block = &got[2 * static_cast<std::size_t>(at)];
                if (!planar) {
                    ASSERT_EQ(dsp_effect_process_f64(effect, block, count), DSP_OK);
                    continue;
                }
                std::vector<double> left, right;
                for (int i = 0; i < count; ++i)
                    left.push_back(block[2 * i]), right.push_back(block[2 * i + 1]);
                double* const channels[]{left.data(), right.data()};
                ASSERT_EQ(dsp_effect_process_planar_f64(effect, channels, count), DSP_OK);
                for (std::size_t i = 0; i < left.size(); ++i)
                    block[2 * i] = left[i], block[2 * i + 1] = right[i];
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
    for (const auto& kind : Corvo::DSP::EffectKinds()) {
        SCOPED_TRACE(kind.name);
        dsp_effect* effect = nullptr;
        dsp_analyser* analyser = nullptr;
        ASSERT_EQ(dsp_effect_create(kind.name, &effect, nullptr), DSP_OK);
        ASSERT_EQ(dsp_analyser_create(8000, &analyser, nullptr), DSP_OK);
        ASSERT_EQ(dsp_effect_prepare(effect, &format, nullptr), DSP_OK);
        std::atomic<bool> started{false}, done{false};
        std::thread audio([&] {
            for (int block = 0; !done || block < 50; ++block) {
                auto samples = TestSupport::Noise<float>(2 * 100);
                ASSERT_EQ(dsp_effect_process_f32(effect, samples.data(), 100), DSP_OK);
                ASSERT_EQ(dsp_analyser_feed_f32(analyser, samples.data(), 100, 2), DSP_OK);
                if (block % 7 == 0) {
                    ASSERT_EQ(dsp_effect_rewind(effect, 0), DSP_OK);
                }
                started = true;
            }
        });
        while (!started) std::this_thread::yield();
        std::vector<std::byte> state(1 << 20);
        int32_t parameters = 0, presets = 0, latency = 0;
        std::size_t needed = 0;
        char text[200];
        ASSERT_EQ(dsp_effect_parameters(effect, &parameters), DSP_OK);
        ASSERT_EQ(dsp_effect_presets(effect, &presets), DSP_OK);
        for (int round = 0; round < 10; ++round) {
            dsp_effect* other = nullptr;
            EXPECT_EQ(dsp_effect_create("Gain", &other, nullptr), DSP_OK);
            for (int32_t p = 0; p < parameters; ++p) {
                EXPECT_EQ(dsp_effect_set(effect, p, static_cast<float>((p + round) % 11) / 10.0f), DSP_OK);
                EXPECT_EQ(dsp_effect_parameter_text(effect, p, DSP_TEXT_VALUE, text, sizeof text, nullptr),
                          DSP_OK);
            }
            EXPECT_EQ(dsp_effect_latency(effect, &latency), DSP_OK);
            EXPECT_EQ(dsp_effect_state(effect, state.data(), state.size(), &needed), DSP_OK);
            EXPECT_EQ(dsp_effect_set_state(effect, state.data(), needed, nullptr), DSP_OK);
            if (presets > 0) {
                EXPECT_EQ(dsp_effect_set_preset(effect, round % presets), DSP_OK);
            }
            EXPECT_EQ(dsp_analyser_refresh(analyser, nullptr), DSP_OK);
            EXPECT_EQ(dsp_close(other), DSP_OK);
        }
        done = true;
        audio.join();
        EXPECT_EQ(dsp_close(analyser), DSP_OK);
        EXPECT_EQ(dsp_close(effect), DSP_OK);
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
