#include "EffectElement.h"

#include <algorithm>
#include <array>
#include <iterator>
#include <optional>

#include "Errors.h"
#include "File.h"
#include "Text.h"

namespace dsphost {
namespace {

using Corvo::DSP::ProcessFlags;

constexpr std::size_t kLargestChunk = 1 << 20;

struct Setting {
    std::string_view key, value;
};

// Cut at the commas; a piece without '=' belongs to the value before it, which held a comma.
std::vector<Setting> SplitSettings(std::string_view text, const std::string& effect) {
    std::vector<Setting> settings;
    for (std::size_t start = 0; start <= text.size();) {
        const std::size_t comma = std::min(text.find(',', start), text.size());
        const std::string_view piece = text.substr(start, comma - start);
        start = comma + 1;
        if (const auto equals = piece.find('='); equals != piece.npos) {
            settings.push_back({Trimmed(piece.substr(0, equals)), Trimmed(piece.substr(equals + 1))});
        } else if (!Trimmed(piece).empty()) {
            if (settings.empty())
                throw UserError(effect + ": \"" + std::string(Trimmed(piece)) +
                                "\" is not a setting; write label=value, for example preset=NAME");
            auto& value = settings.back().value;
            value =
                Trimmed({value.data(), static_cast<std::size_t>(piece.data() + piece.size() - value.data())});
        }
    }
    return settings;
}

// Copies between one interleaved block and its channels one behind the other.
template <typename Sample>
void Deinterleave(const Sample* from, Sample* to, int channels, int frames) {
    for (int c = 0; c < channels; ++c)
        for (int i = 0; i < frames; ++i) *to++ = from[static_cast<std::ptrdiff_t>(i) * channels + c];
}
template <typename Sample>
void Interleave(const Sample* from, Sample* to, int channels, int frames) {
    for (int c = 0; c < channels; ++c)
        for (int i = 0; i < frames; ++i) to[static_cast<std::ptrdiff_t>(i) * channels + c] = *from++;
}

template <typename Sample>
void ProcessPlanar(Effect& effect, Sample* samples, Sample* planes, int frames, const tWAVEFORMATEX& format,
                   ProcessFlags& flags) {
    const int channels = format.nChannels;
    Deinterleave(samples, planes, channels, frames);
    std::array<double*, Effect::MaxNumChannels> buffers{};
    for (int c = 0; c < channels; ++c)
        buffers[static_cast<std::size_t>(c)] =
            reinterpret_cast<double*>(planes + static_cast<std::ptrdiff_t>(c) * frames);
    effect.ProcessNoninterleaved(buffers.data(), frames, &format, flags);
    Interleave(planes, samples, channels, frames);
}

}  // namespace

EffectElement::EffectElement(const EffectKind& kind, std::string_view settings)
    : m_kind(kind), m_effect(kind.make()), m_name(kind.name), m_parameters(DescribeParameters(kind)) {
    const auto all = SplitSettings(settings, m_name);
    std::optional<Setting> start;
    for (const auto& setting : all)
        if (SameNoCase(setting.key, "preset") || SameNoCase(setting.key, "chunk")) {
            if (start) throw UserError(m_name + ": starts from one preset or one chunk, not from several");
            start = setting;
        }
    if (!start)
        m_effect = kind.MakeReady();
    else if (SameNoCase(start->key, "preset"))
        ChoosePreset(start->value);
    else
        LoadChunk(std::string(start->value));
    for (const auto& setting : all)
        if (!start || setting.key.data() != start->key.data()) SetParameter(setting.key, setting.value);
}

EffectElement::~EffectElement() = default;

void EffectElement::ChoosePreset(std::string_view name) {
    std::vector<std::string> names;
    for (int i = 0; i < m_effect->NumPresets(); ++i) names.push_back(m_effect->GetPresetName(i));
    m_effect->SetPreset(static_cast<int>(FindName(name, names, "preset of " + m_name)));
}

void EffectElement::LoadChunk(const std::string& path) {
    const std::string bytes = ReadWhole(path, kLargestChunk);
    UseChunk(m_kind, *m_effect, {bytes.begin(), bytes.end()}, path);
    m_source = path;
}

void EffectElement::SetParameter(std::string_view label, std::string_view text) {
    for (const auto* parameter : FindParameters(*m_effect, m_parameters, label)) {
        std::string warning;
        m_effect->SetParam(parameter->index, ParseValue(*m_effect, *parameter, text, warning), false);
        if (!warning.empty()) PrintMessage("warning: " + warning);
    }
}

bool EffectElement::Prepare(int maxFrames, const tWAVEFORMATEX& format, bool planar) {
    m_format = format;
    m_effect->InitProcessing(maxFrames, &m_format);
    m_planar = planar && m_effect->SupportsNoninterleaved();
    if (m_planar) m_planes.resize(static_cast<std::size_t>(maxFrames) * format.nChannels);
    return m_planar;
}

int EffectElement::Latency() { return std::max(m_effect->GetLatency(), 0); }

void EffectElement::Process(double* samples, int frames, std::int64_t time) {
    ProcessFlags flags;
    PlayDue(time);
    if (!m_planar)
        m_effect->Process(samples, frames, &m_format, flags);
    else if (m_format.wBitsPerSample == 64)
        ProcessPlanar(*m_effect, samples, m_planes.data(), frames, m_format, flags);
    else
        ProcessPlanar(*m_effect, reinterpret_cast<float*>(samples), reinterpret_cast<float*>(m_planes.data()),
                      frames, m_format, flags);
}

double EffectElement::LongestGap() { return m_effect->LongestGap(); }

std::vector<int> EffectElement::AutomationLanes(std::string_view parameter) {
    if (!m_effect->PlaysAutomation()) throw UserError(m_name + " plays no automation");
    std::vector<int> lanes;
    for (const auto* found : FindParameters(*m_effect, m_parameters, parameter))
        lanes.push_back(found->index);
    return lanes;
}

void EffectElement::Automate(int lane, std::span<const AutomationPoint> points) {
    m_lanes.push_back({lane, {points.begin(), points.end()}});
}

// Not as envelopes: an effect goes through those from the start after every SetParam, which takes longer with
// every point.
void EffectElement::PlayDue(std::int64_t time) {
    for (auto& lane : m_lanes)
        // Before its first point a parameter has that point's value.
        for (auto& next = lane.next;
             next < lane.points.size() && (next == 0 || lane.points[next].frame <= time); ++next)
            m_effect->SetParam(lane.index, lane.points[next].value, true);
}

std::vector<std::uint8_t> EffectElement::State() {
    std::vector<std::uint8_t> chunk;
    m_effect->GetSettingsChunk(chunk);
    return chunk;
}

}  // namespace dsphost
