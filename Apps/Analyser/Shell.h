#pragma once

#include <optional>
#include <string>
#include <vector>

namespace analyser {

// Where a file that is played stands, in seconds.
struct Playback {
    double position = 0.0, length = 0.0;
    bool playing = false;
    bool waits = false;  // plays, but nothing comes of it yet
    bool ended = false;  // rests at its end
};

// What the view asks of the window that it is in. Called on the display thread.
class Shell {
public:
    virtual ~Shell() = default;

    // What is heard, for the status line; empty for no status line.
    virtual std::string Source() const { return {}; }
    // What there is to listen to, and which of them is heard; none where there is no choice.
    virtual std::vector<std::string> Inputs() const { return {}; }
    virtual int CurrentInput() const { return -1; }
    virtual void ChooseInput(int) {}

    virtual std::optional<Playback> GetPlayback() const { return std::nullopt; }
    virtual void Seek(double /*seconds*/) {}
    virtual void TogglePlaying() {}

    // Whether the window is the view's own: it may fill the screen, and Ctrl+Q or Ctrl+W ends it.
    virtual bool CanFillScreen() const { return false; }
    virtual void ToggleFullScreen() {}
    // False where there is no clipboard.
    virtual bool Copy(const std::string&) { return false; }
    // The reference tone.
    virtual bool IsToneOn() const = 0;
    virtual void SetTone(bool on) = 0;
};

}  // namespace analyser
