#pragma once

#include <cstdint>
#include <deque>
#include <memory>
#include <string>
#include <vector>

#include <SDL.h>
#include <sndfile.h>

#include "Shell.h"
#include "View.h"

namespace analyser {

// Plays an audio file and feeds the view with what is heard of it at the moment; without sound it feeds a
// thirtieth of a second at every step. One thread.
class Player {
public:
    Player() = default;
    ~Player() { Close(); }
    Player(const Player&) = delete;
    Player& operator=(const Player&) = delete;

    // An empty text, or what is wrong; then what was open before goes on. `sound` asks for a device to hear
    // it.
    std::string Open(const std::string& path, bool sound);
    void Close();
    bool IsOpen() const { return m_file != nullptr; }
    bool IsHeard() const { return m_device != 0; }
    const std::string& Name() const { return m_name; }
    int Rate() const { return m_info.samplerate; }
    Playback Get() const;
    void Seek(double seconds);
    void TogglePlaying();
    // At every refresh, before the view's. At the end of the file it stops.
    void Step(View& view);

private:
    struct Closer {
        void operator()(SNDFILE* file) const { sf_close(file); }
    };

    int Read(int frames);
    void Queue();

    std::unique_ptr<SNDFILE, Closer> m_file;
    SF_INFO m_info{};
    std::string m_name;
    SDL_AudioDeviceID m_device = 0;
    bool m_playing = false, m_ended = false;
    std::int64_t m_start = 0;   // where playing began, in frames
    std::int64_t m_steps = 0;   // since then
    std::int64_t m_fed = 0;     // frames, since then
    std::int64_t m_queued = 0;  // frames given to the device since then
    std::vector<float> m_block;
    std::deque<float> m_ahead;  // given to the device and not fed yet
};

}  // namespace analyser
