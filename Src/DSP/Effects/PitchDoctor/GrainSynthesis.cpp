#include "DSP/Effects/PitchDoctor/GrainSynthesis.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>
#include <xsimd/xsimd.hpp>

namespace Corvo::DSP {
namespace {

constexpr double kDecideAhead = 1.1, kDecideLate = 1.0,
                 kDecideLateUnchanged = 0.7;  // spacings before a grain's centre
constexpr double kLeastWeight = 0.6;
constexpr double kClosest = 0.25;                      // spacing of two grains where voice turns to noise
constexpr double kKeptBelow = 450.0, kKeptTo = 650.0;  // Hz: formants are kept below, and no more above
// While nothing is corrected, a shift in time that an earlier correction left behind is taken back by so much
// of the spacing: five cents.
constexpr double kReturn = 0.003;

using Batch = xsimd::make_sized_batch_t<double, 2>;

constexpr int kPhases = 512;
constexpr double kBeta = 7.0;

// Reading between samples: a sinc in a Kaiser window, for kPhases places from a sample to the next.
template <int kTaps>
struct SincTable {
    std::vector<std::array<double, kTaps>> rows = std::vector<std::array<double, kTaps>>(kPhases + 1);

    SincTable() {
        for (int phase = 0; phase <= kPhases; ++phase) {
            auto& row = rows[static_cast<std::size_t>(phase)];
            double sum = 0.0;
            for (int tap = 0; tap < kTaps; ++tap) {
                const double distance = static_cast<double>(phase) / kPhases - (tap - kTaps / 2 + 1);
                row[static_cast<std::size_t>(tap)] = Sinc(distance) * Kaiser(distance / (kTaps / 2));
                sum += row[static_cast<std::size_t>(tap)];
            }
            for (double& tap : row) tap /= sum;
        }
    }
    // The taps at `share` of the way, which is below 1.
    void Take(double share, std::array<double, kTaps>& taps) const {
        const double place = share * kPhases;
        const auto phase = static_cast<std::size_t>(place);
        const double rest = place - static_cast<double>(phase);
        for (std::size_t tap = 0; tap < taps.size(); ++tap)
            taps[tap] = rows[phase][tap] + rest * (rows[phase + 1][tap] - rows[phase][tap]);
    }

private:
    static double Sinc(double x) {
        if (std::abs(x - std::round(x)) < 1e-12) return std::abs(x) < 0.5 ? 1.0 : 0.0;
        return std::sin(std::numbers::pi * x) / (std::numbers::pi * x);
    }
    static double Kaiser(double u) {
        return std::abs(u) < 1.0 ? Bessel(kBeta * std::sqrt(1.0 - u * u)) / Bessel(kBeta) : 0.0;
    }
    // The modified Bessel function of order 0, by its series.
    static double Bessel(double x) {
        double sum = 1.0, term = 1.0;
        for (int k = 1; term > 1e-17 * sum; ++k) {
            const double factor = x / (2.0 * k);
            term *= factor * factor;
            sum += term;
        }
        return sum;
    }
};

const SincTable<16>& Sincs() {
    static const SincTable<16> table;
    return table;
}

// The value between in[kTaps / 2 - 1] and the sample behind it, at `share` of the way.
template <int kTaps>
double ReadAt(const SincTable<kTaps>& table, double share, const double* in) {
    const double place = share * kPhases;
    const auto phase = static_cast<std::size_t>(place);
    const Batch rest(place - static_cast<double>(phase));
    const double *const before = table.rows[phase].data(), *const after = table.rows[phase + 1].data();
    Batch sums[2] = {Batch(0.0), Batch(0.0)};
    for (int tap = 0; tap < kTaps; tap += 4)
        for (int half = 0; half < 2; ++half) {
            const int at = tap + 2 * half;
            const Batch low = Batch::load_unaligned(before + at), high = Batch::load_unaligned(after + at);
            sums[half] += (low + rest * (high - low)) * Batch::load_unaligned(in + at);
        }
    double lanes[2];
    (sums[0] + sums[1]).store_unaligned(lanes);
    return lanes[0] + lanes[1];
}

// 0.5 + 0.5 cos(pi t), 0 <= t <= 1: the sine's series around the middle.
double HalfCosine(double t) {
    const double x = std::numbers::pi * (0.5 - t), y = x * x;
    double sum = -1.0 / 1307674368000.0;
    for (const double c :
         {1.0 / 6227020800.0, -1.0 / 39916800.0, 1.0 / 362880.0, -1.0 / 5040.0, 1.0 / 120.0, -1.0 / 6.0, 1.0})
        sum = sum * y + c;
    return 0.5 + 0.5 * x * sum;
}

// out[i] = sum of taps[k] * in[i + k], added up in that order for every i.
template <std::size_t kTaps>
void Filter(const std::array<double, kTaps>& taps, const double* in, double* out, int count) {
    int i = 0;
    for (; i + 8 <= count; i += 8) {
        Batch a(0.0), b(0.0), c(0.0), d(0.0);
        for (std::size_t k = 0; k < kTaps; ++k) {
            const Batch tap(taps[k]);
            const double* const from = in + i + k;
            a += tap * Batch::load_unaligned(from);
            b += tap * Batch::load_unaligned(from + 2);
            c += tap * Batch::load_unaligned(from + 4);
            d += tap * Batch::load_unaligned(from + 6);
        }
        a.store_unaligned(out + i);
        b.store_unaligned(out + i + 2);
        c.store_unaligned(out + i + 4);
        d.store_unaligned(out + i + 6);
    }
    for (; i < count; ++i) {
        double sum = 0.0;
        for (std::size_t k = 0; k < kTaps; ++k) sum += taps[k] * in[static_cast<std::size_t>(i) + k];
        out[i] = sum;
    }
}

}  // namespace

void GrainSynthesis::Prepare(Arena& arena) {
    Sincs();  // made here, not while processing
    m_grains = {arena.Take<Grain>(kKept), kKept};
}

void GrainSynthesis::Clear() {
    m_firstGrain = m_endGrain = 0;
    m_mark = -1;
    m_centre = m_rendered = 0.0;
    m_ratio = 1.0;
}

void GrainSynthesis::Rebase(double samples) {
    m_centre -= samples;
    m_rendered -= samples;
    for (auto& grain : m_grains) {
        grain.centre -= samples;
        grain.mark -= samples;
    }
}

// Formants stay where they are when grains are read at their own speed. Above 650 Hz the harmonics are too
// far apart to tell where formants are, and moving all of the spectrum sounds better.
double GrainSynthesis::Speed(const CycleMarks::Mark& mark, double ratio,
                             const GrainSettings& settings) const {
    if (!mark.voiced) return 1.0;
    const double hz = m_rate / std::max(mark.period, 1.0);
    const double kept = settings.formantsKept * std::clamp((kKeptTo - hz) / (kKeptTo - kKeptBelow), 0.0, 1.0);
    const double moved = kept == 1.0 ? 1.0 : std::pow(ratio, 1.0 - kept);
    return moved * settings.formantRatio;
}

void GrainSynthesis::Add(const CycleMarks& marks, std::int64_t number, double centre, double ratio,
                         const GrainSettings& settings) {
    const auto& mark = marks.At(number);
    Grain& grain = m_grains[static_cast<std::size_t>(m_endGrain++) % m_grains.size()];
    grain.centre = centre;
    grain.mark = mark.place;
    grain.left = number > marks.First() ? mark.place - marks.At(number - 1).place : mark.period;
    grain.right = number + 1 < marks.End() ? marks.At(number + 1).place - mark.place : mark.period;
    grain.speed = Speed(mark, ratio, settings);
    if (grain.speed == 1.0) {
        const double shift = mark.place - centre, whole = std::floor(shift);
        grain.aligned = shift == whole;
        grain.shift = static_cast<std::int64_t>(whole);
        if (!grain.aligned) Sincs().Take(shift - whole, grain.taps);
    }
    m_mark = number;
    m_centre = centre;
    m_ratio = ratio;
}

void GrainSynthesis::Widen(const CycleMarks& marks) {
    if (m_mark + 1 >= marks.End() || m_centre < m_rendered) return;
    m_grains[static_cast<std::size_t>(m_endGrain - 1) % m_grains.size()].right =
        marks.At(m_mark + 1).place - marks.At(m_mark).place;
}

void GrainSynthesis::Place(const CycleMarks& marks, const PitchTrack& track, const GrainSettings& settings,
                           double until) {
    if (m_mark < 0) Add(marks, marks.First(), marks.At(marks.First()).place, 1.0, settings);
    Widen(marks);
    while (m_endGrain - m_firstGrain < static_cast<std::int64_t>(m_grains.size()) &&
           (marks.At(m_mark).voiced ? PlaceVoiced(marks, track, settings, until)
                                    : PlaceUnvoiced(marks, settings, until))) {
    }
}

bool GrainSynthesis::PlaceVoiced(const CycleMarks& marks, const PitchTrack& track,
                                 const GrainSettings& settings, double until) {
    const auto& mark = marks.At(m_mark);
    const bool nextVoiced = m_mark + 1 < marks.End() && marks.At(m_mark + 1).voiced;
    double spacing = mark.period;
    if (nextVoiced)
        spacing = marks.At(m_mark + 1).place - mark.place;
    else if (m_mark > marks.First() && marks.At(m_mark - 1).voiced)
        spacing = mark.place - marks.At(m_mark - 1).place;
    const double guess = m_centre + spacing / m_ratio;
    const double width = spacing / std::min(Speed(mark, m_ratio, settings), 1.0);
    if (until < guess - kDecideAhead * width - 2.0) return false;
    // The next mark may be late where the voice is low; until it opens, the grain can wait for it, and longer
    // where nothing is corrected, as the one before alone is the input then.
    const double latest = m_ratio == 1.0 ? kDecideLateUnchanged : kDecideLate;
    if (m_mark + 1 >= marks.End() && until < guess - latest * width - 2.0) return false;
    std::int64_t next = marks.Nearest(guess, m_mark);
    const auto& content = marks.At(next);
    if (!content.voiced) {  // noise stands where it was
        double centre = std::max(content.place, m_centre + kClosest * spacing);
        if (content.place < centre - 1e-6 && next + 1 < marks.End() && !marks.At(next + 1).voiced)
            centre = marks.At(++next).place;
        Add(marks, next, centre, 1.0, settings);
        return true;
    }
    // Read in the middle of what is heard from this grain to the next.
    const double middle = next > m_mark ? 0.5 * (mark.place + content.place) : mark.place + 0.5 * spacing;
    const double correction = track.Correction(middle), ratio = std::exp2(correction / 1200.0);
    double centre = m_centre + spacing / ratio;
    if (next > m_mark) {
        bool all = true;
        for (std::int64_t i = m_mark; i < next; ++i) all = all && marks.At(i).voiced;
        const double distance = content.place - mark.place;
        centre = all ? m_centre + distance / static_cast<double>(next - m_mark) / ratio : content.place;
        if (correction == 0.0) {
            const double most = kReturn * distance;
            const double late = centre - content.place;
            centre = std::abs(late) <= most ? content.place : centre - std::copysign(most, late);
        }
    }
    Add(marks, next, centre, ratio, settings);
    return true;
}

bool GrainSynthesis::PlaceUnvoiced(const CycleMarks& marks, const GrainSettings& settings, double until) {
    std::int64_t next = marks.End();
    while (next > marks.First() && marks.At(next - 1).place > m_centre + 1e-6) --next;
    if (next >= marks.End()) return false;
    const bool tooClose = marks.At(next).place - m_centre < kClosest * marks.At(m_mark).period;
    if (tooClose && next + 1 < marks.End()) ++next;
    const double centre = marks.At(next).place;
    if (until < centre - (centre - marks.At(next - 1).place) - 2.0) return false;
    Add(marks, next, centre, 1.0, settings);
    return true;
}

void GrainSynthesis::Render(std::array<const SampleHistory<double>*, 2> input, int channels,
                            std::int64_t from, int frames,
                            std::array<std::array<double, kMostFrames>, 2>& output) {
    std::array<double, kMostFrames> weights{}, window{}, read{};
    const auto& sincs = Sincs();
    for (auto& channel : output) channel.fill(0.0);
    const auto grain = [&](std::int64_t number) -> Grain& {
        return m_grains[static_cast<std::size_t>(number) % m_grains.size()];
    };
    const auto last = [](const Grain& g) { return g.centre + g.right / g.speed; };
    while (m_firstGrain + 1 < m_endGrain && static_cast<double>(from) > last(grain(m_firstGrain)))
        ++m_firstGrain;
    const auto start = static_cast<double>(from);
    m_rendered = start + frames;
    for (std::int64_t number = m_firstGrain; number < m_endGrain; ++number) {
        const Grain& g = grain(number);
        const double open = std::ceil(g.centre - g.left / g.speed - start);
        const double close = std::ceil(last(g) - start);
        // At a rate of a few Hz a period may have no length, and its grain no place.
        if (!(open < close)) continue;
        const auto within = [frames](double place) {
            return static_cast<int>(std::clamp<double>(place, 0, frames));
        };
        const int begin = within(open), end = within(close);
        if (begin >= end) continue;
        for (int i = begin; i < end; ++i) {
            const double place = (start + i - g.centre) * g.speed;
            window[static_cast<std::size_t>(i)] =
                HalfCosine(std::min(place < 0.0 ? -place / g.left : place / g.right, 1.0));
        }
        const auto b = static_cast<std::size_t>(begin), e = static_cast<std::size_t>(end);
        for (std::size_t i = b; i < e; ++i) weights[i] += window[i];
        for (std::size_t c = 0; c < static_cast<std::size_t>(channels); ++c) {
            if (g.speed != 1.0) {
                for (int i = begin; i < end; ++i) {
                    const double place = g.mark + (start + i - g.centre) * g.speed, whole = std::floor(place);
                    const double* const at = input[c]->At(static_cast<std::int64_t>(whole) - kTaps / 2 + 1);
                    read[static_cast<std::size_t>(i)] = ReadAt(sincs, place - whole, at);
                }
            } else if (g.aligned) {
                std::copy_n(input[c]->At(from + begin + g.shift), end - begin, read.data() + begin);
            } else {
                Filter(g.taps, input[c]->At(from + begin + g.shift - kTaps / 2 + 1), read.data() + begin,
                       end - begin);
            }
            for (std::size_t i = b; i < e; ++i) output[c][i] += window[i] * read[i];
        }
    }
    for (std::size_t c = 0; c < static_cast<std::size_t>(channels); ++c)
        for (std::size_t i = 0; i < static_cast<std::size_t>(frames); ++i)
            output[c][i] /= std::max(weights[i], kLeastWeight);
}

}  // namespace Corvo::DSP
