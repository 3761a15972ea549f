#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <SDL.h>

#include "Input.h"
#include "Player.h"
#include "Shell.h"
#include "Tone.h"
#include "View.h"

namespace analyser {

struct Options {
    std::string file, input, saveTo;
    bool noAudio = false, fullScreen = false;
    int width = 1280, height = 720;
    float dpi = 0.0f;  // 0: the screen's
};

// The window of the stand-alone program: SDL's events to the view, the view's picture into the window.
class Program : public Shell {
public:
    // SDL's video is up. Throws std::runtime_error when there can be no window.
    explicit Program(const Options& options);
    ~Program() override;
    Program(const Program&) = delete;
    Program& operator=(const Program&) = delete;

    // Until the window is closed.
    void Run();

    std::string Source() const override;
    std::vector<std::string> Inputs() const override;
    int CurrentInput() const override;
    void ChooseInput(int index) override;
    std::optional<Playback> GetPlayback() const override;
    void Seek(double seconds) override;
    void TogglePlaying() override;
    bool CanFillScreen() const override { return true; }
    void ToggleFullScreen() override;
    bool Copy(const std::string& text) override { return SDL_SetClipboardText(text.c_str()) == 0; }
    bool IsToneOn() const override { return m_tone.IsOn(); }
    void SetTone(bool on) override;

private:
    void Handle(const SDL_Event& event);
    void HandleKey(const SDL_KeyboardEvent& event);
    void HandlePointer(const SDL_Event& event);
    void HandleWindow(const SDL_WindowEvent& event);
    void LoseDevice(SDL_AudioDeviceID device);
    void Step();
    void Paint();
    void OpenFile(const std::string& path);
    void Listen(const std::string& name);
    void LookAfterSound(bool inTurn);
    std::string Trouble() const;
    bool StartAudio();
    void RestartAudio();
    void CloseTone();
    void LoadSettings();
    void KeepSettings();
    float Dpi() const;

    Options m_options;
    SDL_Window* m_window = nullptr;
    bool m_hasAudio = false, m_quit = false, m_hidden = false, m_stale = true;
    std::unique_ptr<View> m_view;  // before those that feed it
    std::unique_ptr<Input> m_input;
    Player m_player;
    Tone m_tone;
    SDL_AudioDeviceID m_toneDevice = 0;
    double m_toneRate = 48000.0;
    std::string m_chosenInput;
    std::string m_audioDriver;  // once something was heard
    bool m_wasHeard = false;    // the file that plays
    int m_failures = 0;         // to hear what should be there
    unsigned m_keptChoices = 0;
    int m_refreshes = 0;
};

}  // namespace analyser
