// Any bytes as an audio file of the command-line host, and as a stream that is read forwards only.
#include "AudioReader.h"
#include "Errors.h"
#include "Target.h"

namespace {

using Fuzz::Input;

const Fuzz::Target target("AudioFile", [](Input& input) {
    const bool forwardsOnly = input.Flag();
    const auto bytes = input.Rest();
    auto file = dsphost::File::Temporary();
    file.Write(bytes.data(), bytes.size());
    file.Seek(0);
    try {
        dsphost::AudioReader reader(std::move(file), forwardsOnly);
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
