#pragma once

#include <atomic>
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

    static constexpr const char* kSystems = "The system's choice";
    // The names of what is there.
    static std::vector<std::string> Names();

    // The device that is wanted from now on; an empty name is the system's choice. False when it cannot be
    // opened now; Retry does so when it is there.
    bool Want(const std::string& name);
    bool Retry();
    void Close();
    bool IsOpen() const { return m_device != 0; }
    bool HasHeard() const { return m_blocks.load(std::memory_order_relaxed) != 0; }
    // Whether what is wanted is there, so that it should open.
    bool IsThere() const;
    // At each refresh: lets silence be heard where nothing has come for a while.
    void KeepTime();
    // What is listened to, for people.
    std::string Describe() const;
    // It was unplugged.
    bool IsGone(SDL_AudioDeviceID device) const { return m_device == device; }
    // Why it does not listen, for people.
    std::string Trouble() const;

private:
    static void Take(void* input, Uint8* bytes, int count);
    std::string Present() const;

    View& m_view;
    std::string m_wanted, m_error, m_systems;
    std::atomic<unsigned> m_blocks{0};  // that came
    unsigned m_blocksBefore = 0;
    int m_stillFor = 0;  // refreshes
    std::vector<float> m_silence;
    SDL_AudioDeviceID m_device = 0;
    int m_rate = 0, m_channels = 1;
};

}  // namespace analyser
