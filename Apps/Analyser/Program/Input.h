#pragma once

#include <string>
#include <vector>

#include <SDL.h>

#include "View.h"

namespace analyser {

// Listens to an input device and feeds the view from SDL's audio thread. Everything else on one thread.
class Input {
public:
    explicit Input(View& view) : m_view(view) {}
    ~Input() { Close(); }
    Input(const Input&) = delete;
    Input& operator=(const Input&) = delete;

    // The names of what is there.
    static std::vector<std::string> Names();

    // The device that is wanted from now on; an empty name is the system's choice. False when it cannot be
    // opened now; Retry does so when it is there.
    bool Want(const std::string& name);
    const std::string& Wanted() const { return m_wanted; }
    bool Retry();
    void Close();
    bool IsOpen() const { return m_device != 0; }
    int Rate() const { return m_rate; }
    // It was unplugged.
    bool IsGone(SDL_AudioDeviceID device) const { return m_device == device; }
    // Why it does not listen, for people.
    std::string Trouble() const;

private:
    static void Take(void* input, Uint8* bytes, int count);

    View& m_view;
    std::string m_wanted, m_error;
    SDL_AudioDeviceID m_device = 0;
    int m_rate = 0, m_channels = 1;
};

}  // namespace analyser
