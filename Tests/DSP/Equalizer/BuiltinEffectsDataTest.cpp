#include "DSP/Equalizer/BuiltinEffectsData.h"

#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <string>

namespace {

using Data = Corvo::DSP::builtin_effects_data;
using Corvo::DSP::_eq_data;

// Writes its letter, and the band's index if there is one, into a log.
template <typename... Args>
struct Scribe : Corvo::DSP::EqListener<Args...> {
    Scribe(std::string& l, char c) : log(l), letter(c) {}
    std::unique_ptr<Corvo::DSP::EqListener<Args...>> Clone() const override {
        return std::make_unique<Scribe>(*this);
    }
    void Invoke(Args... args) override {
        log += letter;
        (log.append(std::to_string(args)), ...);
    }
    std::string& log;
    char letter;
};

void Listen(Data& data, std::string& log) {
    data.Q_changed.Add(std::make_unique<Scribe<int>>(log, 'q'));
    data.freq_changed.Add(std::make_unique<Scribe<int>>(log, 'f'));
    data.boost_changed.Add(std::make_unique<Scribe<int>>(log, 'b'));
    data.bypass_changed.Add(std::make_unique<Scribe<>>(log, 'p'));
    data.structure_changed.Add(std::make_unique<Scribe<>>(log, 's'));
}

using Words = std::array<int, 4>;  // type, frequency, boost, Q

// Who is told what by which operation; from a band 1 that is a bypassed peak of 2500 Hz, 6 dB, Q 300. The
// setters are called twice: the second call changes nothing.
TEST(BuiltinEffectsData, TellsTheRightListeners) {
    constexpr int kType = 2 | _eq_data::kBypassBand;
    static constexpr Words kBand{kType, 2500, 60, 300};
    struct Case {
        const char* fault;
        std::function<void(Data&)> act;
        const char* log;
        Words band = kBand;
        int numBands = 3;
    };
    // clang-format off
    const Case kCases[] = {
        {"frequency",      [](Data& d) { d.SetEqFreq(1, 80), d.SetEqFreq(1, 80); },   "f1", {kType, 80, 60, 300}},
        {"boost",          [](Data& d) { d.SetEqBoost(1, -9), d.SetEqBoost(1, -9); }, "b1", {kType, 2500, -9, 300}},
        {"Q",              [](Data& d) { d.SetEqQ(1, 7), d.SetEqQ(1, 7); },           "q1", {kType, 2500, 60, 7}},
        {"a peak's own Q", [](Data& d) { d.SetDefaultQ(1), d.SetDefaultQ(1); },       "q1", {kType, 2500, 60, 200}},
        {"bypass",         [](Data& d) { d.SetBypass(1, false), d.SetBypass(1, false); }, "pp", {2, 2500, 60, 300}},
        {"one default",    [](Data& d) { d.defaults(1, 0); },                         "s",  {6, 100, 0, 50}},
        {"a whole band",   [](Data& d) { d.SetEqData(1, {1, 2, 3, 4}); },             "s",  {1, 2, 3, 4}},
        {"deleted first",  [](Data& d) { d.DeleteBand(0); },                          "ss", {5, 6000, 0, 50}, 2},
        {"too many bands", [](Data& d) { d.numBands = 25, d.DeleteBand(19); },        "ss", kBand, 24},
    };
    // clang-format on
    for (const auto& c : kCases) {
        std::string log;
        Data data;
        data.SetEqData(1, {kBand[0], kBand[1], kBand[2], kBand[3]});
        Listen(data, log);
        c.act(data);
        EXPECT_EQ(log, c.log) << c.fault;
        EXPECT_EQ((Words{data.GetEqType(1), data.GetEqFreq(1), data.GetEqBoost(1), data.GetEqQ(1)}), c.band)
            << c.fault;
        EXPECT_EQ(data.GetNumBands(), c.numBands) << c.fault;
    }
}

// Catches listeners shared or lost; leaks show under the address sanitizer.
TEST(BuiltinEffectsData, CopiesHaveListenersOfTheirOwn) {
    std::string log;
    Data data, assigned;
    for (const char letter : {'1', '2', '3'})
        data.structure_changed.Add(std::make_unique<Scribe<>>(log, letter));
    {
        const Data copy(data);
        assigned = copy;
    }
    assigned.SetNumBands(1);
    EXPECT_EQ(log, "123") << "in the order of their addition, the head last";
    EXPECT_EQ(data.GetNumBands(), 3);
}

}  // namespace
