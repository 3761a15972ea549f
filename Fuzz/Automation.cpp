// Any text as an automation file of the command-line host.
#include "Automation.h"

#include "Errors.h"
#include "Render.h"
#include "Target.h"

namespace {

using Fuzz::Input;

const Fuzz::Target target("Automation", [](Input& input) {
    static const std::string kChain[]{"Tremolo", "Gain", "Echo", "Gain"};
    const auto bytes = input.Rest();
    const std::string text(bytes.begin(), bytes.end());
    dsphost::Chain chain(kChain);
    try {
        dsphost::ReadAutomation(text, "a file", 48000, chain);
    } catch (const dsphost::UserError& error) {
        Fuzz::Require(std::string_view(error.what()).size() < 2000, "a message is a line that one can read");
        return;
    }
    chain.Prepare(512, dsphost::ChainFormat(2, 48000, 64), false);
    std::vector<double> block(2 * 512, 0.25);
    for (std::int64_t at = 0, frames = 0; at < 20000; at += frames) {
        frames = chain.FramesToCut(at, 512);
        Fuzz::Require(frames > 0 && frames <= 512, "a cut lets time pass");
        chain.Process(block.data(), static_cast<int>(frames), at);
    }
});

}  // namespace
