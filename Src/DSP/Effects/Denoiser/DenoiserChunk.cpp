#include <algorithm>
#include <array>
#include <cmath>
#include <new>

#include "DSP/Effects/Denoiser/DenoiserPresets.h"
#include "DSP/Effects/Denoiser/DenoiserState.h"
#include "DSP/Effects/Denoiser/DenoiserTable.h"
#include "DSP/Effects/Framework/FileValues.h"
#include "Threads/SharedRecord.h"

// The settings chunk: the parameters and the learned noise.
namespace Corvo::DSP {
namespace {

using namespace Denoising;
using KivFiles::CMemoryFile;
using KivFiles::ReadValue;
using KivFiles::WriteValue;

constexpr std::int32_t kVersion = 1;
constexpr float kMostPower = 1e30f;

void Require(bool valid) {
    if (!valid) throw CorvoException("Error reading data");
}

// Never kept: a project that is opened neither learns from another passage nor clears its profile.
bool IsMomentary(const ParameterRow& row) {
    return row.word == WordAt(&Settings::learn) || row.word == WordAt(&Settings::clear);
}

void WriteProfile(CMemoryFile& file, const NoiseProfile& profile) {
    WriteValue(file, profile.seconds);
    WriteValue(file, profile.rate);
    WriteValue(file, profile.channels);
    for (std::size_t c = 0; c < profile.channels; ++c)
        for (const auto& spectrum : profile.power[c])
            KivFiles::WriteDoubles(file, {spectrum.begin(), spectrum.end()});
}

// Doubles behind a count: none, or the powers of so many bins. A piece at a time: there are thousands.
std::vector<float> ReadPowers(CMemoryFile& file, std::size_t bins) {
    const auto count = ReadValue<std::int32_t>(file);
    Require(count == 0 || count == static_cast<std::int32_t>(bins));
    std::vector<float> powers(count == 0 ? 0 : bins);
    std::array<std::array<std::uint8_t, sizeof(double)>, 64> piece;
    for (std::size_t done = 0; done < powers.size();) {
        const std::size_t some = std::min(powers.size() - done, piece.size());
        const auto bytes = static_cast<std::int64_t>(some * sizeof(double));
        Require(file.Read(piece.data(), bytes) == bytes);
        for (std::size_t i = 0; i < some; ++i, ++done) {
            const auto power = LittleEndianValue<double>(piece[i]);
            Require(power >= 0.0 && power <= kMostPower);
            powers[done] = static_cast<float>(power);
        }
    }
    return powers;
}

NoiseProfile ReadProfile(CMemoryFile& file) {
    NoiseProfile profile;
    profile.seconds = ReadValue<double>(file);
    profile.rate = ReadValue<std::uint32_t>(file);
    profile.channels = ReadValue<std::uint32_t>(file);
    Require(std::isfinite(profile.seconds) && profile.seconds >= 0.0 &&
            profile.channels <= profile.power.size() && (profile.rate > 0 || profile.channels == 0));
    for (std::size_t c = 0; c < profile.channels; ++c)
        for (std::size_t which = 0; which < kLengths; ++which)
            profile.power[c][which] = ReadPowers(file, NoiseProfile::Bins(which, profile.rate));
    bool any = false;
    for (std::size_t which = 0; which < kLengths; ++which) {
        const bool filled = !profile.power[0][which].empty();
        any = any || filled;
        for (std::size_t c = 1; c < profile.channels; ++c) Require(profile.power[c][which].empty() != filled);
    }
    Require((profile.seconds > 0.0) == any);
    return profile;
}

}  // namespace

int DenoiserProcessor::GetSettingsChunkSize() {
    const auto& profile = m_state->Known();
    std::size_t size = 4 + 4 + 4 + 8 * Table().rows.size() + 8 + 4 + 4;
    for (std::size_t c = 0; c < profile.channels; ++c)
        for (const auto& spectrum : profile.power[c]) size += 4 + 8 * spectrum.size();
    return static_cast<int>(size);
}

void DenoiserProcessor::GetSettingsChunk(std::vector<std::uint8_t>& chunk) try {
    CMemoryFile file;
    WriteValue(file, m_chunk_tag);
    WriteValue(file, kVersion);
    std::vector<double> values;
    for (const auto& row : Table().rows)
        values.push_back(IsMomentary(row)
                             ? 0.0
                             : PlainValue(row, static_cast<std::int32_t>(LoadWord(&m_settings, row.word))));
    KivFiles::WriteDoubles(file, values);
    WriteProfile(file, m_state->Known());
    chunk.assign(file.Data(), file.Data() + file.GetLength());
} catch (const CorvoException&) {
    throw std::bad_alloc();  // nothing else can happen to a file in memory
}

void DenoiserProcessor::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    // Only read from.
    CMemoryFile file(const_cast<std::uint8_t*>(chunk.data()), static_cast<std::int64_t>(chunk.size()));
    try {
        const auto tag = ReadValue<std::int32_t>(file);
        Require(ReadValue<std::int32_t>(file) == kVersion);
        std::vector<double> values;
        KivFiles::ReadDoubles(file, values);
        Require(std::ranges::all_of(values, [](double value) { return std::isfinite(value); }));
        auto words = WordsOf(DenoiserPresets::kPresets[0].settings);
        for (std::size_t i = 0; i < std::min(values.size(), Table().rows.size()); ++i) {
            const auto& row = Table().rows[i];
            if (!IsMomentary(row)) words[row.word] = static_cast<std::uint32_t>(WordOf(row, values[i]));
        }
        auto profile = ReadProfile(file);
        m_chunk_tag = tag;
        m_state->Load(std::move(profile));
        Assign(m_settings, RecordOf<Settings>(words));
        MarkStale();
    } catch (const CorvoException&) {
        return;  // nothing has changed
    }
}

}  // namespace Corvo::DSP
