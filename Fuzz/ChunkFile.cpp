// Any bytes, or a chunk with some of them changed, as the file that chunk=FILE of the command-line host
// names.
#include "EffectParameters.h"
#include "Errors.h"
#include "Target.h"

namespace {

using Fuzz::Input;

const Fuzz::Target target("ChunkFile", [](Input& input) {
    const auto all = dsphost::EffectKinds();
    const auto& kind = all[static_cast<std::size_t>(input.Between(0, static_cast<int>(all.size()) - 1))];
    const auto effect = kind.MakeReady();
    std::vector<std::uint8_t> chunk;
    effect->GetSettingsChunk(chunk);
    for (int i = input.Between(0, 8); i > 0; --i)
        chunk[input.Raw<std::uint16_t>() % chunk.size()] = input.Raw<std::uint8_t>();
    if (input.Flag()) chunk = input.Bytes(20000);
    try {
        dsphost::UseChunk(kind, *effect, chunk, "a file");
        for (const auto& parameter : dsphost::DescribeParameters(kind))
            dsphost::CurrentText(*effect, parameter);
    } catch (const dsphost::UserError&) {
    }
});

}  // namespace
