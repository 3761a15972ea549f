// The file in memory, on its own memory and on the caller's, against a vector that does the same.
#include "DSP/Effects/Framework/MemoryFile.h"
#include "Target.h"

namespace {

using Fuzz::Input;
using KivFiles::CMemoryFile;

// A place that needs little memory, or one that no memory reaches.
std::int64_t Place(Input& input) {
    const auto any = input.Raw<std::int64_t>();
    return input.Flag() || (any > -0x200000000 && any < 0x200000000) ? any % 100000 : any;
}

void Step(CMemoryFile& file, Input& input) {
    std::vector<double> numbers(3, 0.5);
    std::uint8_t bytes[256];
    switch (input.Between(0, 5)) {
        case 0: {
            const auto data = input.Bytes(255);
            const auto before = file.GetPosition();
            const auto written = file.Write(data.data(), static_cast<std::int64_t>(data.size()));
            if (before < 0) break;
            Fuzz::Require(written == static_cast<std::int64_t>(data.size()), "all is written");
            Fuzz::Require(file.Seek(before, CMemoryFile::FromStart) == before, "a position is taken");
            if (file.GetLength() < before + written) break;  // of unbounded files
            Fuzz::Require(file.Read(bytes, written) == written, "what was written is read");
            Fuzz::Require(std::equal(data.begin(), data.end(), bytes), "what was written comes back");
            break;
        }
        case 1:
            file.Read(bytes, input.Between(-1, sizeof bytes));
            break;
        case 2:
            file.Seek(Place(input), input.Between(-1, 3));
            break;
        case 3:
            WriteDoubles(file, numbers);
            break;
        case 4:
            ReadDoubles(file, numbers);
            break;
        default:
            file.SetUnbounded(input.Flag());
    }
}

const Fuzz::Target target("MemoryFile", [](Input& input) {
    auto callers = input.Bytes(300);
    CMemoryFile own, borrowed(callers.data(), static_cast<std::int64_t>(callers.size()));
    CMemoryFile& file = input.Flag() ? own : borrowed;
    for (int step = 0; step < 200 && !input.AtEnd(); ++step) try {
            Step(file, input);
        } catch (const Corvo::CorvoException&) {
            if (file.GetPosition() > 1000000) return;  // out of memory: not usable any more
        }
});

}  // namespace
