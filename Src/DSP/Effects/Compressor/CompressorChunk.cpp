#include <algorithm>
#include <mutex>
#include <span>

#include "DSP/Effects/Compressor/Compressor.h"
#include "DSP/Effects/Compressor/CompressorSides.h"
#include "DSP/Effects/Parameters/SettingsChunk.h"

namespace Corvo::DSP {

using namespace CompressorPrivate;

namespace {

constexpr int kChunkSize = 16112;

template <typename Word>
std::int32_t Within(Word word, std::int32_t low, std::int32_t high) {
    return static_cast<std::int32_t>(std::clamp<Word>(word, low, high));
}

template <typename Word>
Compressor::Parameters Repaired(const TRANSFORM_PARAMETERS<Word>& words) {
    Compressor::Parameters good;
    for (std::size_t side = 0; side < 2; ++side) {
        good.attack[side] = Within(words.attack[side], kShortestTime, kLongestTime);
        good.release[side] = Within(words.release[side], kShortestTime, kLongestTime);
        good.outGain[side] = Within(words.outGain[side], kSilentOutGain, kHighestOutGain);
    }
    good.stereoLink = words.stereoLink != 0;
    good.makeUp = words.makeUp != 0;
    good.flags = static_cast<std::int32_t>(words.flags);
    std::ranges::transform(words.reserved, good.reserved.begin(),
                           [](Word word) { return static_cast<std::int32_t>(word); });
    return good;
}

bool VisitParameters(auto&& visit, auto& p) {
    return visit(p.attack) && visit(p.release) && visit(p.outGain) && visit(p.stereoLink) &&
           visit(p.makeUp) && visit(p.flags) && visit(p.reserved);
}

// `skip` passes over so many words: what is beyond the points in use.
bool VisitCurves(auto&& visit, auto& map, auto&& skip) {
    auto& curves = map.m_comp_map;
    if (!(visit(curves[0].count) && visit(curves[1].count) && visit(map.reserved))) return false;
    for (auto& curve : curves) {
        const auto used = static_cast<std::size_t>(
            std::clamp<std::int32_t>(curve.count, 0, static_cast<std::int32_t>(curve.points.size())));
        for (auto& point : std::span(curve.points).first(used))
            if (!(visit(point.x) && visit(point.y) && visit(point.slope))) return false;
        if (!skip(3 * (curve.points.size() - used))) return false;
    }
    return true;
}

}  // namespace

int Compressor::GetSettingsChunkSize() { return kChunkSize; }

void Compressor::GetSettingsChunk(std::vector<std::uint8_t>& chunk) {
    const std::lock_guard lock(m_ui->section);
    ApplyEnvelopeToUi();
    const auto& parameters = m_ui->edited.parameters;
    const auto map = m_ui->edited.curves.Map();
    ChunkWriter write(chunk, kChunkSize);
    const auto clear = [&](std::size_t words) {
        while (words > 0 && write(std::int32_t{0})) --words;
        return words == 0;
    };
    write(m_chunk_tag) && VisitParameters(write, parameters) && VisitCurves(write, map, clear) &&
        write(m_ui->preset) && write(map.last_threshold) && write(map.last_ratio_step);
}

template <typename Word>
bool Compressor::LoadChunk(const std::vector<std::uint8_t>& chunk, std::int32_t& tag) {
    ChunkReader read(chunk);
    TRANSFORM_PARAMETERS<Word> words;
    Settings settings;
    const auto skip = [&](std::size_t unused) { return read.Skip(4 * unused); };
    if (!(read(tag) && VisitParameters(read, words) && VisitCurves(read, settings.map, skip))) return false;
    settings.parameters = Repaired(words);
    for (auto& curve : settings.map.m_comp_map) curve.Repair();

    const std::lock_guard lock(m_ui->section);
    ApplyEnvelopeToUi();
    auto& map = settings.map;
    map.last_threshold = m_ui->edited.curves.last_threshold;
    map.last_ratio_step = m_ui->edited.curves.last_ratio_step;
    read(m_ui->preset) && read(map.last_threshold) && read(map.last_ratio_step);
    m_ui->edited = settings;
    SubmitUiSettingsChange();
    return true;
}

void Compressor::SetSettingsChunk(const std::vector<std::uint8_t>& chunk) {
    if (std::int32_t tag = 0; LoadChunk<std::int32_t>(chunk, tag)) m_chunk_tag = tag;
}

bool Compressor::FitsOldChunk(const std::vector<std::uint8_t>& chunk) {
    std::int32_t unread = 0;
    return LoadChunk<std::int64_t>(chunk, unread);
}

}  // namespace Corvo::DSP
