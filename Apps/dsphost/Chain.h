#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "ChainElement.h"

namespace dsphost {

// The effects of a --fx list, one behind the other.
class Chain {
public:
    // Each text is "NAME" or "NAME: settings". Throws UserError.
    explicit Chain(std::span<const std::string> texts);
    explicit Chain(std::vector<std::unique_ptr<ChainElement>> elements);

    std::size_t Size() const { return m_elements.size(); }
    ChainElement& Element(std::size_t index) { return *m_elements[index]; }

    // Before Prepare. Points count in frames of the chain's input and are met to the frame, latencies
    // included, when blocks are cut where FramesToCut says.
    void Automate(std::size_t element, int lane, std::span<const AutomationPoint> points);

    // Announces the format and the largest block. The result names the elements that take no planar blocks
    // although those were asked for.
    std::vector<std::string> Prepare(int maxFrames, const tWAVEFORMATEX& format, bool planar);
    std::int64_t Latency() const { return m_latency; }
    // The longest silence, in seconds, inside the tail of the whole chain as its effects stand now.
    double LongestGap();

    // Frames from `position`, which a block must not pass; `most` where nothing is in the way.
    int FramesToCut(std::int64_t position, int most) const;
    // Processes an interleaved block in place; `position` counts the frames given to the chain before it.
    void Process(double* samples, int frames, std::int64_t position);

private:
    std::vector<std::unique_ptr<ChainElement>> m_elements;
    std::vector<std::int64_t> m_delays;  // of each element's input against the chain's
    std::vector<std::vector<std::int64_t>> m_points;
    std::vector<std::int64_t> m_cuts;
    std::int64_t m_latency = 0;
};

}  // namespace dsphost
