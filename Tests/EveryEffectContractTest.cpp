#include <gtest/gtest.h>

#include <charconv>
#include <sstream>

#include "DSP/Effects/Chorus/Chorus.h"
#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/Reverb/Reverb.h"
#include "DSP/Effects/Tremolo/Autovol.h"
#include "Support/EveryEffect.h"

using namespace TestSupport;

// What hosts and saved projects rely on: every parameter's names, words, texts and place in the chunk, and
// every preset. EveryEffectContract.txt has it as it was promised; a change of the library that fails here
// breaks projects.
namespace {

constexpr std::string_view kPromised =
#include "contract.inc"
    ;

std::string Number(auto value, auto... base) {
    char text[32];
    return {text, std::to_chars(text, text + sizeof text, value, base...).ptr};
}
std::string Hex(std::uint64_t value) { return Number(value, 16); }
std::string Narrow(const std::wstring& wide) { return {wide.begin(), wide.end()}; }

// FNV-1a.
std::uint64_t SumOf(const Bytes& bytes) {
    std::uint64_t sum = 0xCBF29CE484222325;
    for (const auto byte : bytes) sum = (sum ^ byte) * 0x100000001B3;
    return sum;
}

bool HasCurves(const Bytes& chunk) { return chunk.size() > 16000; }
std::string WordOf(const Bytes& chunk, std::size_t at) {
    return std::to_string(at).append(":").append(Hex(At<std::uint32_t>(chunk, at)));
}

// Every word another, exact as an integer and as a float; the bytes above the lower four do not count.
Bytes CountingChunk(std::size_t leading, std::size_t words, std::size_t width) {
    Bytes chunk(leading + words * width, 0xEE);
    for (std::size_t i = 0; i < words; ++i) Put(chunk, leading + i * width, (static_cast<int>(i) + 64) << 20);
    return chunk;
}

class EveryEffectContract : public EveryEffect {
protected:
    // What a parameter is, and what it is from 0 to 1: text, value and words of the chunk.
    static void DescribeParameter(std::ostream& out, int external) {
        const auto effect = Make();
        const auto about = effect->Describe(external);
        out << external << " is " << about.real << " \"" << about.label << "\" \"" << about.name << "\" ["
            << about.unit << "] type " << static_cast<int>(about.type) << ", rests at "
            << Number(about.neutral);
        if (auto* const recorded = dynamic_cast<Corvo::DSP::CorvoEffect*>(effect.get())) {
            const auto& record = recorded->GetParametersInfo()[about.real];
            out << ", recorded \"" << Narrow(record.szLabel) << "\" " << record.mopCaps << " "
                << Number(record.mpdMinValue) << ".." << Number(record.mpdMaxValue);
        }
        for (const auto& [text, value] : about.choices) out << "; " << text << "=" << Number(value);
        out << "\n";
        std::vector<Bytes> chunks;
        std::vector<std::string> shown;
        for (const float value : {0.0f, 0.25f, 0.5f, 0.75f, 1.0f}) {
            const auto moved = Make();
            moved->SetParam(external, value, false);
            chunks.push_back(Chunk(*moved));
            shown.push_back(std::string("  \"").append(Text(*moved, external, value)).append("\""));
            for (int side = 0; side < moved->GetParamCountReal() / moved->GetParamCount(); ++side)
                shown.back().append(" ").append(Number(moved->GetParamPlain(about.real + side)));
        }
        // Curves are left out: they come from the system's mathematics.
        for (std::size_t at = 0; at < chunks[0].size(); at += at == 112 && HasCurves(chunks[0]) ? 15988 : 4)
            for (std::size_t i = 0; i < 5; ++i)
                if (std::ranges::any_of(
                        chunks, [&](const auto& c) { return WordOf(c, at) != WordOf(chunks[0], at); }))
                    shown[i].append(" ").append(WordOf(chunks[i], at));
        for (const auto& line : shown) out << line << "\n";
    }

    static std::string Now() {
        const auto effect = GetParam().Make();
        std::ostringstream out;
        out << "== " << effect->GetName() << "\nimage " << effect->GetImage() << ", icon "
            << effect->GetPluginIconPath() << ", chunk of " << effect->GetSettingsChunkSize() << ", default "
            << effect->GetDefaultPreset() << ", parameters " << effect->GetParamCount() << " of "
            << effect->GetParamCountReal() << " to " << effect->GetAllSupportedParameterIds().back()
            << "\nsections";
        for (const auto& section : effect->GetParamUiSections()) out << " [" << section << "]";
        GenericUIData pads;
        effect->InitializeXyEditingData(pads);
        out << "\npads " << effect->WantsXySerialization();
        for (const auto& pad : pads.groups) {
            out << " [" << pad.name << "]";
            for (const auto& axis : {pad.x_axis, pad.y_axis})
                for (const int parameter : axis)
                    EXPECT_TRUE(parameter >= 0 && parameter < effect->GetParamCountReal());
        }
        out << "\n";
        for (int i = 0; i < effect->GetParamCount(); ++i) DescribeParameter(out, i);
        out << "new";
        for (const float value : AllParams(*effect)) out << " " << Number(value);
        for (int i = 0; i < effect->NumPresets(); ++i) {
            effect->SetPreset(i);
            const auto chunk = Chunk(*effect);
            out << "\npreset " << effect->GetPresetName(i) << " ";
            if (!HasCurves(chunk)) out << Hex(SumOf(chunk));
            for (int j = 0; HasCurves(chunk) && j < effect->GetParamCount(); ++j)
                out << " " << Number(effect->GetParam(j)) << "=" << Text(*effect, j);
            if (effect->GetPresetValues(i) != AllParams(*effect)) out << ", values untold";
        }
        out << "\n";
        if (effect->GetSettingsChunkSize() > 200) return out.str();  // loaded by tests of their own
        // Where each word is kept, and as what.
        const auto own = Chunk(*effect);
        auto counting = CountingChunk(0, own.size() / 4, 4);
        if (effect->GetName() == "Cantrix") std::copy_n(own.begin(), 8, counting.begin());  // says how many
        effect->SetSettingsChunk(counting);
        const auto kept = Chunk(*effect);
        out << "counting";
        for (std::size_t at = 0; at < own.size(); at += 4)
            if (WordOf(kept, at) != WordOf(counting, at)) out << " " << WordOf(kept, at);
        for (int real = 0; real < effect->GetParamCountReal(); ++real)
            out << " " << Number(effect->GetParamPlain(real));
        out << "\n";
        return out.str();
    }
};

// The effects that had an older layout offer it by their own type.
template <typename... Effects>
bool FitsOldChunk(CorvoEffectBase& effect, const Bytes& chunk) {
    const auto fits = [&](auto* typed) { return typed && typed->FitsOldChunk(chunk); };
    return (fits(dynamic_cast<Effects*>(&effect)) || ...);
}

}  // namespace

INSTANTIATE_TEST_SUITE_P(All, EveryEffectContract, testing::ValuesIn(AllEffects()), EffectTestName);

TEST_P(EveryEffectContract, IsAsPromised) {
    const auto now = Now();
    const auto heading = now.substr(0, now.find('\n') + 1);
    const auto from = kPromised.find(heading);
    ASSERT_NE(from, kPromised.npos) << "EveryEffectContract.txt has nothing of it. It is:\n" << now;
    EXPECT_EQ(now, kPromised.substr(from, kPromised.find("== ", from + 3) - from))
        << "where this is meant to change, EveryEffectContract.txt changes with it";
}

// Catches the oldest layout half loaded, or its words in the wrong places.
TEST_P(EveryEffectContract, TakesItsOldestLayout) {
    const auto effect = GetParam().Make();
    const auto fits = [&](const Bytes& chunk) {
        return FitsOldChunk<Corvo::DSP::Autovol, Corvo::DSP::Chorus, Corvo::DSP::Echo, Corvo::DSP::Reverb>(
            *effect, chunk);
    };
    const std::size_t words = effect->GetName() == "Reverb" ? 18 : 22;
    const auto wide = CountingChunk(4, words, 8), fresh = Chunk(*effect);
    EXPECT_FALSE(fits({wide.begin(), wide.end() - 1}));
    EXPECT_EQ(Chunk(*effect), fresh) << "a byte is missing";
    if (!fits(wide)) GTEST_SKIP() << "had none, or it is tested apart";
    auto today = CountingChunk(4, words, 4);
    today.resize(fresh.size());
    EXPECT_EQ(Chunk(*effect), today);
}
