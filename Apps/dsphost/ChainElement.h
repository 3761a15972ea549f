#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "Platform/WaveFormat.h"

namespace dsphost {

// From `frame` of the input on, a parameter has this normalised value.
struct AutomationPoint {
    std::int64_t frame;
    float value;
};

// One station of the processing chain: what `render` and other commands know of whatever is named by --fx.
class ChainElement {
public:
    virtual ~ChainElement() = default;

    virtual std::string Name() const = 0;
    // Called once before the first block, after everything was set. `planar` asks for planar blocks inside,
    // where the element supports them; the result says whether it does.
    virtual bool Prepare(int maxFrames, const tWAVEFORMATEX& format, bool planar) = 0;
    // In frames; valid after Prepare.
    virtual int Latency() { return 0; }
    // Processes an interleaved block in place, float or double samples as the format says. `time` is the
    // frame of the element's own input that the block starts at; negative while an earlier element's latency
    // runs out.
    virtual void Process(double* samples, int frames, std::int64_t time) = 0;

    // The longest silence, in seconds, that may lie between two sounds of its tail.
    virtual double LongestGap() { return 0.0; }

    // The index of a parameter's automation lane, two for a left/right pair named without its side. Throws
    // UserError when there is no such parameter or the element plays no automation.
    virtual std::vector<int> AutomationLanes(std::string_view parameter);
    // Points in ascending order; before Prepare.
    virtual void Automate(int lane, std::span<const AutomationPoint> points);

    // The file that it was made from; empty where there is none.
    virtual std::string SourceFile() const { return {}; }

    // The whole state as the library's own bytes. Throws UserError when the element has no such form.
    virtual std::vector<std::uint8_t> State();
};

// What --fx can name: the name in front of the colon, and how the text behind it becomes an element.
// `make` throws UserError for settings that it does not understand.
struct ElementKind {
    std::string name;
    std::function<std::unique_ptr<ChainElement>(std::string_view settings)> make;
};

}  // namespace dsphost
