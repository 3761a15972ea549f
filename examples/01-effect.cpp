// One effect on a buffer: a click goes in, its echo comes out 300 ms later.
#include <cmath>
#include <cstdio>
#include <vector>

#include "DSP/Effects/Echo/Echo.h"
#include "DSP/Effects/ParameterInput.h"

int main() {
    constexpr int rate = 48000, frames = rate / 2;

    // 1. Make the effect and set it up, with texts as it shows them itself.
    Corvo::DSP::Echo echo;
    echo.SetPreset(echo.GetDefaultPreset());
    for (const int index : Corvo::DSP::FindParameters(echo, "Depth"))
        echo.SetParam(index, Corvo::DSP::ReadParameter(echo, index, "300 ms").normalised, false);

    // 2. Say what the blocks look like. All memory is made here.
    tWAVEFORMATEX format{};
    format.nChannels = 1;
    format.nSamplesPerSec = rate;
    format.wBitsPerSample = 32;  // floats
    echo.InitProcessing(frames, &format);
    if (!echo.IsPrepared()) return 1;

    // 3. Process in place. Stereo would be left, right, left, right ...
    std::vector<float> buffer(frames);
    buffer[0] = 1.0f;
    Corvo::DSP::ProcessFlags flags;
    echo.Process(buffer.data(), frames, &format, flags);

    int loudest = rate / 10;  // behind the click itself
    for (int frame = loudest; frame < frames; ++frame)
        if (std::abs(buffer[frame]) > std::abs(buffer[loudest])) loudest = frame;
    std::printf("%s: a click of 1 comes back after %d ms as %.2f\n", echo.GetName().c_str(),
                loudest * 1000 / rate, buffer[loudest]);
    return loudest * 1000 / rate == 300 ? 0 : 1;
}
