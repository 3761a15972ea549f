#include "DSP/Effects/Denoiser/DenoiserEngine.h"

#include <bit>
#include <cmath>
#include <limits>

namespace Corvo::DSP::Denoising {
namespace {

constexpr float kPerDb = 0.23025851f;  // natural logarithm of a power
constexpr int kGlide = 512;
constexpr int kTrackerSettles = 8192;
constexpr double kMostRate = std::numeric_limits<int>::max();

// The value at a place between the bands.
float AtPlace(const std::array<float, kGainBands>& bands, float place) {
    const auto below = std::min(static_cast<std::size_t>(place), kGainBands - 2);
    return bands[below] + (bands[below + 1] - bands[below]) * (place - static_cast<float>(below));
}

bool IsFlat(const std::array<float, kGainBands>& bands) {
    return std::ranges::all_of(bands, [&](float band) { return band == bands[0]; });
}

bool SameCurves(const EngineSettings& a, const EngineSettings& b) {
    return a.reductionDb == b.reductionDb && a.sensitivityDb == b.sensitivityDb && a.gainDb == b.gainDb &&
           a.rangeDb == b.rangeDb;
}

}  // namespace

void DenoiserEngine::Glide::Set(double to, int frames) {
    if (to == target && (frames > 0 || left == 0)) return;
    target = to;
    left = frames;
    if (frames > 0)
        step = (to - value) / frames;
    else
        value = to;
}

std::size_t DenoiserEngine::LengthIndex(std::size_t size) const {
    return static_cast<std::size_t>(std::ranges::find(kLearnedLengths, m_set->sizes[size].length) -
                                    kLearnedLengths.begin());
}

void DenoiserEngine::Prepare(double rate, std::size_t channels, int sizeSet) {
    const Scale scale = Scale::Of(rate);
    const bool afresh = !(scale == m_scale) || m_dry.empty();
    if (afresh) {
        m_dry.clear();
        m_scale = scale;
        m_tick = std::min(kUnit, scale(kUnit));
        for (std::size_t i = 0; i < kLengths; ++i) m_windows[i].Prepare(scale(kLearnedLengths[i]));
        for (std::size_t i = 0; i < kLengths; ++i)
            if (i != kTrackIndex) m_conversions[i].Prepare(m_windows[kTrackIndex], m_windows[i]);
        ReserveFor(m_tableMemory, [&](Arena& arena) { LayoutTables(arena); });
    }
    m_tables = TablesFor(rate);
    for (std::size_t i = 0; i < kLengths; ++i) {
        m_windows[i].Use(*m_tables, i);
        m_conversions[i].Use(m_tables->responses[i]);
    }
    if (afresh) ReserveMemory(rate, sizeSet);
    m_learner.Cancel();
    m_learnedSeconds = 0.0;
    m_preparedRate = rate;
    SetFormat(rate, channels);
}

// What stays as it is through every change of settings.
void DenoiserEngine::LayoutTables(Arena& arena) {
    const int longest = m_windows.back().length;
    float* const scratch = arena.Take(static_cast<std::size_t>(longest));
    float* const work = arena.Take(Fft::SplitTransform::WorkFloats(longest));
    std::size_t converting = 0;
    for (const auto& conversion : m_conversions) converting = std::max(converting, conversion.WorkFloats());
    float* const convertingWork = arena.Take(converting);
    for (std::size_t i = 0; i < kLengths; ++i) {
        m_windows[i].WorkIn(scratch, work);
        m_windows[i].PrepareRates(arena);
        m_conversions[i].WorkIn(convertingWork);
        for (auto* each : {&m_curves[i].offset, &m_curves[i].floor, &m_curves[i].logFloor})
            *each = arena.Take(m_windows[i].Values());
    }
    for (auto& channel : m_learned)
        for (std::size_t i = 0; i < kLengths; ++i)
            channel[i] = {arena.Take(m_windows[i].Values()), m_windows[i].Values()};
    for (auto& passage : m_passage)
        passage = {arena.Take(m_windows.back().Values()), m_windows.back().Values()};
    m_order = {arena.Take(m_windows[kTrackIndex].Values()), m_windows[kTrackIndex].Values()};
    m_learner.Prepare(arena, m_windows);
}

// For any settings.
void DenoiserEngine::ReserveMemory(double rate, int sizeSet) {
    std::size_t most = 0;
    m_channels = kMostChannels;
    m_rate = rate;
    for (const auto& set : kSizeSets) {
        m_set = &set;
        Arena counting;
        Layout(counting);
        most = std::max(most, counting.Taken());
    }
    m_set = &SizeSetAt(sizeSet);
    m_arena.Reserve(most);
    m_dry = UntouchedZeros<double>(kMostChannels * static_cast<std::size_t>(m_scale(kLongestRing)));
    m_dryTime = 0;
}

void DenoiserEngine::SetFormat(double rate, std::size_t channels) {
    EndPassage();
    m_rate = rate;
    m_channels = channels;
    m_fresh = true;
    if (m_dryTime > 0) std::ranges::fill(m_dry, 0.0);
    m_dryTime = 0;
    for (auto& windows : m_windows) windows.SetRate(rate, m_windows[kBlendIndex].length);
    Start(false);
}

// Hands out the memory. Called with every set, to see how much it takes, and with the one in use.
void DenoiserEngine::Layout(Arena& arena) {
    const auto ring = static_cast<std::size_t>(m_scale(kLongestRing));
    std::array<SpectrumConversion*, 3> conversions{};
    const auto count = static_cast<std::size_t>(m_set->count);
    for (std::size_t i = 0; i < count; ++i)
        if (const auto index = LengthIndex(i); index != kTrackIndex) conversions[i] = &m_conversions[index];
    for (std::size_t c = 0; c < m_channels; ++c) {
        m_input[c].Take(arena, ring);
        for (std::size_t i = 0; i < count; ++i) m_sized[i][c].Take(arena, ring);
        if (count > 1) m_blended[c].Take(arena, ring);
        m_trackers[c].Prepare(arena, m_windows[kTrackIndex], m_tables->tracker,
                              std::span(conversions).first(count), m_rate);
    }
    for (std::size_t i = 0; i < count; ++i)
        m_reducers[i].Prepare(arena, m_set->sizes[i], m_windows[LengthIndex(i)], m_channels);
    if (count > 1)
        m_blend.Prepare(arena, m_windows[kBlendIndex], std::span(m_reducers).first(count), m_channels,
                        m_rate);
}

// Begins a stream: at the very start, or in one whose window lengths change. What came before is then heard
// unprocessed until the new windows have filled and the noise is known again.
void DenoiserEngine::Start(bool afterSound) {
    m_arena.Reset();
    Layout(m_arena);
    m_latencyBefore = m_format.latency;
    m_format = FormatOf(static_cast<int>(std::min(m_rate, kMostRate)), static_cast<int>(m_channels), *m_set,
                        m_scale);
    m_time = 0;
    PlacePaces();
    ChooseMode(true);
    m_wetFrom = afterSound ? m_format.latency + (Tracks() ? m_scale(kTrackerSettles) : 0) : 0;
    AimOutput(false);
    m_jump.Set(afterSound ? 1.0 : 0.0, 0);
    m_jump.Set(0.0, m_scale(kGlide));
}

void DenoiserEngine::PlacePaces() {
    const int unit = m_scale(kUnit), ticksPerUnit = unit / m_tick;
    const auto ticks = [&](int units) { return (units - 1) * ticksPerUnit + 1; };
    for (std::size_t i = 0; i < static_cast<std::size_t>(m_set->count); ++i) {
        const auto& plan = m_set->sizes[i];
        const auto& reducer = m_reducers[i];
        m_reducerPaces[i].Set(reducer.Hop() + std::int64_t{plan.delay} * unit, reducer.Hop(),
                              ticks(plan.units), m_tick, reducer.Steps(),
                              [&](int step) { return reducer.Cost(step); });
    }
    const int trackHop = m_windows[kTrackIndex].length / kOverlap;
    for (std::size_t c = 0; c < m_channels; ++c)
        m_trackerPaces[c].Set(trackHop, trackHop, ticks(m_set->trackerUnits), m_tick, m_trackers[c].Steps(),
                              [&](int step) { return m_trackers[c].Cost(step); });
    if (m_set->count == 1) return;
    // Frame 0 ends with the blend's first hop of samples; all of it is needed when they come out.
    const std::int64_t hop = m_windows[kBlendIndex].length / kOverlap,
                       due = m_format.latency - (kOverlap - 1) * hop;
    m_blendPace.Set(due - std::int64_t{m_set->blendUnits - 1} * unit, hop, ticks(m_set->blendUnits), m_tick,
                    m_blend.Steps(), [](int) { return 1.0; });
}

void DenoiserEngine::Apply(const EngineSettings& settings) {
    const bool first = m_fresh;
    m_fresh = false;
    const auto* const set = &SizeSetAt(settings.sizeSet);
    const bool resize = set != m_set;
    if (!settings.learn || resize) EndPassage();
    const bool curves = first || resize || !SameCurves(settings, m_settings);
    m_settings = settings;
    if (resize) {
        m_set = set;
        Start(!first);
    }
    if (settings.learn && !m_learner.Active() && AtPreparedRate()) m_learner.Begin(m_time, m_channels);
    if (curves) m_curvesDue.fill(true);
    for (auto& reducer : std::span(m_reducers).first(static_cast<std::size_t>(m_set->count)))
        reducer.SetGains(settings.gains);
    for (auto& tracker : std::span(m_trackers).first(m_channels)) {
        tracker.SetMaterial(settings.music);
        tracker.SetWhitening(settings.gains.whitening > 0.0f);
    }
    // Only the next frames whiten by it: those at hand keep the gains they began with.
    if (settings.gains.whitening > 0.0f) FindReference();
    ChooseMode(false);
    AimOutput(!first);
}

void DenoiserEngine::CookCurves(std::size_t size) {
    m_curvesDue[size] = false;
    const auto& kernels = BestSpectrumKernels();
    auto& curves = m_curves[LengthIndex(size)];
    const float* const places = m_windows[LengthIndex(size)].bins->gainPlace;
    const std::size_t values = m_windows[LengthIndex(size)].Values();
    const bool flat = IsFlat(m_settings.gainDb) && IsFlat(m_settings.rangeDb);
    const std::size_t worked = flat ? kBinsAtOnce : values;
    for (std::size_t bin = 0; bin < worked; ++bin) {
        const float place = places[bin];
        curves.floor[bin] = kPerDb * (m_settings.sensitivityDb + AtPlace(m_settings.gainDb, place));
        curves.logFloor[bin] =
            -0.5f * kPerDb * std::min(m_settings.reductionDb, AtPlace(m_settings.rangeDb, place));
    }
    kernels.exponential(curves.floor, curves.offset, worked);
    kernels.exponential(curves.logFloor, curves.floor, worked);
    for (float* const curve : {curves.offset, curves.floor, curves.logFloor})
        std::fill(curve + worked, curve + values, curve[0]);
    m_reducers[size].SetCurves(curves.offset, curves.floor, curves.logFloor);
}

void DenoiserEngine::AimOutput(bool glide) {
    const bool residue = m_settings.residue && !m_settings.learn,
               unchanged = m_settings.learn || m_time < m_wetFrom;
    const double mix = unchanged ? 0.0 : static_cast<double>(m_settings.mix);
    const int frames = glide ? m_scale(kGlide) : 0;
    m_dryGain.Set(residue ? mix : 1.0 - mix, frames);
    m_wetGain.Set(residue ? -mix : mix, frames);
}

// Settles whose noise is reduced. The trackers start afresh when what they follow is another.
void DenoiserEngine::ChooseMode(bool restart) {
    const auto before = m_mode;
    m_mode = UsesLearned() ? m_settings.profile : ProfileMode::Adaptive;
    if (m_mode == before && !restart) return;
    for (std::size_t c = 0; c < m_channels; ++c) {
        m_trackers[c].Start(m_mode == ProfileMode::Following ? m_learned[c][kTrackIndex].data() : nullptr);
        m_trackers[c].SetMaterial(m_settings.music);
        m_trackers[c].SetWhitening(m_settings.gains.whitening > 0.0f);
        m_trackerPaces[c].Drop();
    }
}

NoiseAt DenoiserEngine::NoiseFor(std::size_t channel, std::size_t size, std::int64_t centre) const {
    if (Tracks() && m_trackers[channel].Ready()) return m_trackers[channel].At(size, centre);
    if (!UsesLearned()) return {nullptr, nullptr, 0.0f};
    const float* const learned = m_learned[channel][LengthIndex(size)].data();
    return {learned, learned, 0.0f};
}

void DenoiserEngine::Tick() {
    const auto input = std::span<const SampleRing>(m_input).first(m_channels);
    if (Tracks())
        for (std::size_t c = 0; c < m_channels; ++c)
            m_trackerPaces[c].Tick(
                m_time, [&](std::int64_t frame, int step) { m_trackers[c].Run(step, frame, m_input[c]); });
    for (std::size_t i = 0; i < static_cast<std::size_t>(m_set->count); ++i)
        m_reducerPaces[i].Tick(m_time, [&](std::int64_t frame, int step) {
            auto& job = m_jobs[i];
            if (m_curvesDue[i]) CookCurves(i);
            if (step == 0) {
                job.frame = frame;
                job.input = input;
                job.output = std::span<const SampleRing>(m_sized[i]).first(m_channels);
                for (std::size_t c = 0; c < m_channels; ++c)
                    job.noise[c] = NoiseFor(c, i, (frame - 1) * m_reducers[i].Hop());
                // Powers grow with the window's length.
                const auto [longer, track] =
                    std::pair(m_reducers[i].Hop() * kOverlap, m_windows[kTrackIndex].length);
                job.logReference = std::log(static_cast<float>(longer) / static_cast<float>(track));
                float sum = 0.0f;
                for (std::size_t c = 0; c < m_channels; ++c)
                    sum += Tracks() ? m_trackers[c].LogReference() : m_learnedReference[c];
                job.logReference += sum / static_cast<float>(m_channels);
            }
            m_reducers[i].Run(step, job);
        });
    if (m_set->count > 1)
        m_blendPace.Tick(m_time, [&](std::int64_t frame, int step) {
            m_blend.Run(step, {.frame = frame,
                               .inputs = std::span(m_sized).first(static_cast<std::size_t>(m_set->count)),
                               .output = std::span<const SampleRing>(m_blended).first(m_channels)});
        });
    if (m_learner.Active()) m_learner.Run(m_time, input);
    if (m_wetFrom > 0 && m_time == m_wetFrom) AimOutput(true);
}

// What was learned goes into one mean with what had been before, by the time each took.
void DenoiserEngine::EndLearning() {
    const auto input = std::span<const SampleRing>(m_input).first(m_channels);
    if (!m_learner.End(m_time, input)) return;
    const double seconds = static_cast<double>(m_learner.Length()) / m_rate;
    const auto share = static_cast<float>(seconds / (seconds + m_learnedSeconds));
    for (std::size_t c = 0; c < m_channels; ++c)
        for (std::size_t i = 0; i < kLengths; ++i) {
            auto &passage = m_passage[i % 2], &shorter = m_passage[(i + 1) % 2];
            const std::size_t bins = m_windows[i].Bins();
            if (const float* const mean = m_learner.Mean(c, i))
                std::copy_n(mean, bins, passage.data());
            else
                ConvertSpectrum(std::span(shorter).first(m_windows[i - 1].Bins()), m_windows[i - 1].length,
                                m_rate, passage.data(), bins, m_windows[i].length, m_rate);
            const auto learned = m_learned[c][i];
            for (std::size_t bin = 0; bin < bins; ++bin)
                learned[bin] = (1.0f - share) * learned[bin] + share * (passage[bin] + kLeastPower);
            std::fill(learned.begin() + static_cast<std::ptrdiff_t>(bins), learned.end(), 1.0f);
        }
    for (std::size_t c = m_channels; c < kMostChannels; ++c)
        for (std::size_t i = 0; i < kLengths; ++i)
            std::ranges::copy(m_learned[0][i], m_learned[c][i].begin());
    m_learnedSeconds += seconds;
    m_learnedChannels = m_channels;
    m_newlyLearned = true;
    FinishLearned();
}

void DenoiserEngine::Adopt(const NoiseProfile& profile) {
    m_learner.Cancel();
    m_newlyLearned = false;
    m_learnedSeconds = 0.0;
    bool whole = profile.Learned();
    for (std::size_t c = 0; c < kMostChannels && whole; ++c) {
        const auto& spectra = profile.power[std::min<std::size_t>(c, profile.channels - 1)];
        for (std::size_t i = 0; i < kLengths && whole; ++i) {
            // A length that was not learned is made from the next shorter one, or else a longer one.
            std::size_t from = i;
            while (from > 0 && spectra[from].empty()) --from;
            while (from < kLengths && spectra[from].empty()) ++from;
            whole = from < kLengths;
            if (!whole) break;
            const auto learned = m_learned[c][i];
            const std::size_t bins = m_windows[i].Bins();
            ConvertSpectrum(spectra[from], NoiseProfile::Length(from, profile.rate), profile.rate,
                            learned.data(), bins, m_windows[i].length, m_preparedRate);
            for (float& power : learned.first(bins)) power = std::max(power, kLeastPower);
            std::fill(learned.begin() + static_cast<std::ptrdiff_t>(bins), learned.end(), 1.0f);
        }
    }
    if (whole) {
        m_learnedSeconds = profile.seconds;
        m_learnedChannels = profile.channels;
        if (m_channels == 1 && profile.channels > 1) MixLearned();
    }
    FinishLearned();
}

// One channel gets the mean of what two have learned.
void DenoiserEngine::MixLearned() {
    for (std::size_t i = 0; i < kLengths; ++i) {
        const auto left = m_learned[0][i], right = m_learned[1][i];
        for (std::size_t bin = 0; bin < left.size(); ++bin)
            left[bin] = right[bin] = 0.5f * (left[bin] + right[bin]);
    }
    m_learnedChannels = 1;
}

void DenoiserEngine::FinishLearned() {
    m_referenceDue = HasLearned();
    ChooseMode(m_mode == ProfileMode::Following);
}

// The middle one of the logarithms of the powers, where the residual's whitening pivots.
void DenoiserEngine::FindReference() {
    if (!std::exchange(m_referenceDue, false)) return;
    const std::size_t bins = m_windows[kTrackIndex].Bins();
    for (std::size_t c = 0; c < kMostChannels; ++c) {
        BestSpectrumKernels().logarithm(m_learned[c][kTrackIndex].data(), m_order.data(), m_order.size());
        const auto middle = m_order.begin() + static_cast<std::ptrdiff_t>(bins / 2);
        std::nth_element(m_order.begin(), middle, m_order.begin() + static_cast<std::ptrdiff_t>(bins));
        m_learnedReference[c] = *middle;
    }
}

void DenoiserEngine::Export(LearnedNoise& learned) const {
    learned.seconds = m_learnedSeconds;
    learned.rate = static_cast<std::uint32_t>(m_preparedRate);
    learned.channels = static_cast<std::uint32_t>(HasLearned() ? m_learnedChannels : 0);
    auto to = learned.power.begin();
    for (std::size_t c = 0; c < learned.channels; ++c)
        for (std::size_t i = 0; i < kLengths; ++i)
            to = std::copy_n(m_learned[c][i].begin(), m_windows[i].Bins(), to);
}

}  // namespace Corvo::DSP::Denoising
