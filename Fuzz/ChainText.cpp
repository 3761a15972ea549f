// Any text after --fx of the command-line host; a chain that comes of it also runs.
#include "Chain.h"
#include "Errors.h"
#include "Render.h"
#include "Target.h"

namespace {

using Fuzz::Input;

std::vector<std::string> Lines(std::span<const std::uint8_t> bytes) {
    std::vector<std::string> lines(1);
    for (const auto byte : bytes) {
        if (byte != '\n')
            lines.back() += static_cast<char>(byte);
        else if (lines.size() < 4)
            lines.emplace_back();
    }
    return lines;
}

const Fuzz::Target target("ChainText", [](Input& input) {
    const auto texts = Lines(input.Rest());
    // "chunk=FILE" would read whatever the text names.
    for (const auto& text : texts)
        if (text.find('/') != text.npos) return;
    try {
        dsphost::Chain chain(texts);
        chain.Prepare(256, dsphost::ChainFormat(2, 44100, 32), true);
        std::vector<double> block(2 * 256, 0.25);
        for (std::int64_t at = 0; at < 1024; at += 256) chain.Process(block.data(), 256, at);
        for (std::size_t i = 0; i < chain.Size(); ++i) chain.Element(i).LongestGap();
    } catch (const dsphost::UserError& error) {
        Fuzz::Require(std::string_view(error.what()).size() < 4000, "a message is a line that one can read");
    }
});

}  // namespace
