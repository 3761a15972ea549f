// A small real-time host for JACK: 10-realtime-host EFFECT, then lines such as "Mix=40 %", until the end.
#include <jack/jack.h>
#include <algorithm>
#include <atomic>
#include <iostream>
#include <memory>
#include <stdexcept>
#include <string>

#include "DSP/Effects/EffectKinds.h"
#include "DSP/Effects/ParameterInput.h"
using namespace Corvo::DSP;

static std::unique_ptr<CorvoEffectBase> effect;
static tWAVEFORMATEX format;
static jack_port_t *in, *out;
static std::atomic<long> blocks;

static int Prepare(jack_nframes_t frames, void*) {  // again when the server changes its blocks
    effect->InitProcessing(static_cast<int>(frames), &format);
    return effect->IsPrepared() ? 0 : 1;
}

static int Play(jack_nframes_t frames, void*) {  // on the audio thread: no memory, no waiting
    auto* const samples = static_cast<float*>(jack_port_get_buffer(out, frames));
    std::copy_n(static_cast<const float*>(jack_port_get_buffer(in, frames)), frames, samples);
    ProcessFlags flags;
    effect->Process(samples, static_cast<int>(frames), &format, flags);
    return ++blocks, 0;
}

int main(int count, char** arguments) {
    const auto* const kind = FindEffectKind(count == 2 ? arguments[1] : "Echo");
    jack_client_t* const client = jack_client_open("dspdll", JackNoStartServer, nullptr);
    if (!kind || !client) return std::cerr << "no such effect, or no JACK server\n", 1;
    effect = kind->MakeReady();
    format.nChannels = 1;
    format.nSamplesPerSec = jack_get_sample_rate(client);
    format.wBitsPerSample = 32;
    in = jack_port_register(client, "in", JACK_DEFAULT_AUDIO_TYPE, JackPortIsInput, 0);
    out = jack_port_register(client, "out", JACK_DEFAULT_AUDIO_TYPE, JackPortIsOutput, 0);
    jack_set_buffer_size_callback(client, Prepare, nullptr);
    jack_set_process_callback(client, Play, nullptr);
    if (Prepare(jack_get_buffer_size(client), nullptr) != 0 || jack_activate(client) != 0) return 1;
    for (std::string line; std::getline(std::cin, line);) {  // heard from the next block on
        const auto equals = line.find('=');
        const auto indices = FindParameters(*effect, line.substr(0, equals));
        if (indices.empty()) std::cerr << "there is no such parameter: " << line << '\n';
        try {
            for (const int i : indices)
                effect->SetParam(i, ReadParameter(*effect, i, line.substr(equals + 1)).normalised, false);
        } catch (const std::invalid_argument& error) {
            std::cerr << error.what() << '\n';
        }
    }
    jack_client_close(client);
    std::cout << kind->name << ": " << blocks << " blocks at " << format.nSamplesPerSec << " Hz\n";
    return blocks > 0 ? 0 : 1;
}
