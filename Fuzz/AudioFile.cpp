// Any bytes as an audio file of the command-line host, and through a pipe.
#include "AudioReader.h"
#include "Errors.h"
#include "MemoryPath.h"
#include "Target.h"

namespace {

using Fuzz::Input;
using Fuzz::MemoryPath;

const Fuzz::Target target("AudioFile", [](Input& input) {
    const auto kind = input.Flag() ? MemoryPath::Kind::Pipe : MemoryPath::Kind::File;
    const MemoryPath file(input.Rest(), kind);
    try {
        dsphost::AudioReader reader(file.Path());
        dsphost::RequireFormat(reader, 48, "48 are enough");
        constexpr int kBlock = 256;
        std::vector<double> block(static_cast<std::size_t>(kBlock * reader.Channels()));
        for (int blocks = 0; blocks < 500; ++blocks) {
            const int frames = reader.Read(block.data(), kBlock);
            Fuzz::Require(frames >= 0 && frames <= kBlock, "no more frames than asked for");
            if (frames < kBlock) break;
        }
    } catch (const dsphost::UserError&) {
    } catch (const dsphost::IoError&) {
    }
});

}  // namespace
