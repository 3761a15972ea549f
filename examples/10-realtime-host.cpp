// A small real-time host for JACK: 10-realtime-host EFFECT, then lines such as "Mix=40 %", until the end.
#include <jack/jack.h>

#include <algorithm>
#include <atomic>
#include <iostream>
#include <stdexcept>
#include <string>

#include "DSP/Effects/EffectKinds.h"
#include "DSP/Effects/ParameterInput.h"
using namespace Corvo::DSP;

struct Host {
    std::unique_ptr<CorvoEffectBase> effect;
    tWAVEFORMATEX format{};
    jack_port_t *in = nullptr, *out = nullptr;
    std::atomic<long> blocks{0};
};

static int Prepare(jack_nframes_t frames, void* data) {  // again when the server changes its blocks
    Host& host = *static_cast<Host*>(data);
    return host.effect->InitProcessing(static_cast<int>(frames), &host.format) ? 0 : 1;
}

static int Play(jack_nframes_t frames, void* data) {  // on the audio thread: no memory, no waiting
    Host& host = *static_cast<Host*>(data);
    auto* const out = static_cast<float*>(jack_port_get_buffer(host.out, frames));
    std::copy_n(static_cast<const float*>(jack_port_get_buffer(host.in, frames)), frames, out);
    ProcessFlags flags;
    host.effect->Process(out, static_cast<int>(frames), &host.format, flags);
    ++host.blocks;
    return 0;
}

int main(int count, char** arguments) {
    const auto* const kind = FindEffectKind(count == 2 ? arguments[1] : "Echo");
    jack_client_t* const client = jack_client_open("dspdll", JackNoStartServer, nullptr);
    if (!kind || !client) return std::cerr << "no such effect, or no JACK server\n", 1;
    Host host{kind->MakeReady()};
    host.format.nChannels = 1;
    host.format.nSamplesPerSec = jack_get_sample_rate(client);
    host.format.wBitsPerSample = 32;
    host.in = jack_port_register(client, "in", JACK_DEFAULT_AUDIO_TYPE, JackPortIsInput, 0);
    host.out = jack_port_register(client, "out", JACK_DEFAULT_AUDIO_TYPE, JackPortIsOutput, 0);
    jack_set_buffer_size_callback(client, Prepare, &host);
    jack_set_process_callback(client, Play, &host);
    if (Prepare(jack_get_buffer_size(client), &host) != 0 || jack_activate(client) != 0) return 1;
    for (std::string line; std::getline(std::cin, line);) try {  // heard from the next block on
            for (const int i : FindParameters(*host.effect, line.substr(0, line.find('='))))
                host.effect->SetParam(
                    i, ReadParameter(*host.effect, i, line.substr(line.find('=') + 1)).normalised, false);
        } catch (const std::invalid_argument& error) {
            std::cerr << error.what() << '\n';
        }
    jack_client_close(client);
    std::cout << kind->name << ": " << host.blocks << " blocks at " << host.format.nSamplesPerSec << " Hz\n";
    return host.blocks > 0 ? 0 : 1;
}
