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

// Plays an audio file and feeds the view with a thirtieth of a second of it at every step, once that is
// heard. One thread.
class Player {
public:
    Player() = default;
    ~Player() { Close(); }
    Player(const Player&) = delete;
    Player& operator=(const Player&) = delete;

    // An empty text, or what is wrong; then what was open before goes on. It plays, silently until Hear.
    std::string Open(const std::string& path);
    void Close();
    bool IsOpen() const { return m_file != nullptr; }
    // Lets the file be heard from now on; false while there is no output for it.
    bool Hear();
    // It goes on silently.
    void Mute();
    bool IsHeard() const { return m_device != 0; }
    bool IsHeardOn(SDL_AudioDeviceID device) const { return m_device == device; }
    const std::string& Name() const { return m_name; }
    int Rate() const { return m_info.samplerate; }
    Playback Get() const;
    void Seek(double seconds);
    // At its end it stays there: seek first.
    void TogglePlaying();
    // At every refresh, before the view's. At the end of the file it stops.
    void Step(View& view);

private:
    struct Closer {
        void operator()(SNDFILE* file) const { sf_close(file); }
    };

    std::int64_t Position() const { return m_start + m_fed; }
    std::size_t Outputs() const;
    void GoTo(std::int64_t frame);
    void Reopen();
    int Read(int frames);
    void Queue();
    std::int64_t Taken() const;
    int Next(int frames);
    void End(View& view);

    std::unique_ptr<SNDFILE, Closer> m_file;
    SF_INFO m_info{};
    std::string m_path, m_name;
    SDL_AudioDeviceID m_device = 0;
    bool m_playing = false, m_waits = false;
    bool m_atEnd = false;      // nothing more to read
    int m_silent = 0;          // frames fed after it
    std::int64_t m_start = 0;  // where playing began, in frames
    std::int64_t m_read = 0;   // frames since then
    std::int64_t m_fed = 0;    // of them
    std::int64_t m_steps = 0;  // thirtieths of a second fed
    std::vector<float> m_block;
    std::deque<float> m_ahead;  // given to the device and not fed yet
};

}  // namespace analyser
