#include "Program.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <stdexcept>

#include <cairo.h>

#include "Drawing/Views/Look.h"
#include "Files.h"
#include "FloatSound.h"
#include "Spectrum/Tuner/Tuner.h"

namespace analyser {
namespace {

constexpr int kRefreshes = 30;
constexpr int kRetryEvery = 60, kKeepEvery = 60;  // refreshes
// Until the sound system is asked anew: soon for one that was heard, seldom where there may be none.
constexpr int kFailures = 2, kFailuresAtFirst = 5;
constexpr const char* kInputLine = "Input = ";

struct KeyPair {
    SDL_Keycode sdl;
    char32_t key;
};
constexpr KeyPair kKeys[] = {
    {SDLK_ESCAPE, kKeyEscape}, {SDLK_RETURN, kKeyEnter},     {SDLK_KP_ENTER, kKeyEnter},
    {SDLK_LEFT, kKeyLeft},     {SDLK_RIGHT, kKeyRight},      {SDLK_UP, kKeyUp},
    {SDLK_DOWN, kKeyDown},     {SDLK_HOME, kKeyHome},        {SDLK_END, kKeyEnd},
    {SDLK_MENU, kKeyMenu},     {SDLK_APPLICATION, kKeyMenu}, {SDLK_F1, kKeyHelp},
    {SDLK_F10, kKeyMenu},      {SDLK_F11, kKeyFullScreen},
};

std::filesystem::path SettingsPath() { return SettingsFolder() / "analyser.conf"; }

}  // namespace

Program::Program(const Options& options) : m_options(options) {
    Uint32 flags = SDL_WINDOW_RESIZABLE | SDL_WINDOW_ALLOW_HIGHDPI;
    if (options.fullScreen) flags |= SDL_WINDOW_FULLSCREEN_DESKTOP;
    m_window = SDL_CreateWindow("Analyser", SDL_WINDOWPOS_CENTERED, SDL_WINDOWPOS_CENTERED, options.width,
                                options.height, flags);
    if (!m_window) throw std::runtime_error(std::string("no window can be opened: ") + SDL_GetError());
    m_view = std::make_unique<View>(*this);
    m_view->SetFolder(options.saveTo);
    m_input = std::make_unique<Input>(*m_view);
    LoadSettings();
    if (!options.input.empty()) m_chosenInput = options.input;
    if (!options.noAudio) StartAudio();
    if (!options.file.empty()) OpenFile(options.file);
    if (!m_player.IsOpen()) Listen(m_chosenInput);
}

Program::~Program() {
    KeepSettings();
    m_input->Close();
    m_player.Close();
    CloseTone();
    SDL_DestroyWindow(m_window);
}

void Program::Run() {
    const auto perSecond = static_cast<double>(SDL_GetPerformanceFrequency());
    const auto now = [&] { return static_cast<double>(SDL_GetPerformanceCounter()) / perSecond; };
    constexpr double kPeriod = 1.0 / kRefreshes, kLate = 0.25;
    double next = now() + kPeriod;
    while (!m_quit) {
        SDL_Event event;
        const double wait = next - now();
        const int milliseconds = wait > 0.0 ? static_cast<int>(std::ceil(wait * 1000.0)) : 0;
        if (milliseconds > 0 ? SDL_WaitEventTimeout(&event, milliseconds) : SDL_PollEvent(&event)) {
            Handle(event);
            if (now() < next) continue;
        }
        if (now() < next) continue;
        next = now() - next > kLate ? now() + kPeriod : next + kPeriod;
        Step();
    }
}

void Program::Step() {
    ++m_refreshes;
    if (m_player.IsOpen())
        m_player.Step(*m_view);
    else
        m_input->KeepTime();
    if (m_refreshes % kRetryEvery == 0) LookAfterSound(true);
    if (m_refreshes % kKeepEvery == 0) KeepSettings();
    m_stale = m_view->Refresh() || m_stale;
    if (m_stale && !m_hidden) Paint();
}

float Program::Dpi() const {
    if (m_options.dpi > 0.0f) return m_options.dpi;
    // Between plain and twice as fine in quarters, so that texts keep their usual sizes on plain screens.
    float dpi = 96.0f;
    const int display = SDL_GetWindowDisplayIndex(m_window);
    if (SDL_GetDisplayDPI(display, nullptr, &dpi, nullptr) != 0) return 96.0f;
    return dpi < 132.0f ? 96.0f : std::round(dpi / 24.0f) * 24.0f;
}

// Straight into the window's memory where it is laid out as Cairo's, else through a copy.
void Program::Paint() {
    SDL_Surface* const surface = SDL_GetWindowSurface(m_window);
    if (!surface) return;
    m_stale = false;
    const bool straight = surface->format->format == SDL_PIXELFORMAT_RGB888;
    SDL_Surface* const canvas =
        straight ? surface
                 : SDL_CreateRGBSurfaceWithFormat(0, surface->w, surface->h, 32, SDL_PIXELFORMAT_RGB888);
    if (!canvas) return;
    if (SDL_MUSTLOCK(canvas)) SDL_LockSurface(canvas);
    cairo_surface_t* const image = cairo_image_surface_create_for_data(
        static_cast<unsigned char*>(canvas->pixels), CAIRO_FORMAT_RGB24, canvas->w, canvas->h, canvas->pitch);
    cairo_t* const context = cairo_create(image);
    m_view->Draw(context, canvas->w, canvas->h, Dpi());
    cairo_destroy(context);
    cairo_surface_destroy(image);
    if (SDL_MUSTLOCK(canvas)) SDL_UnlockSurface(canvas);
    if (!straight) {
        SDL_BlitSurface(canvas, nullptr, surface, nullptr);
        SDL_FreeSurface(canvas);
    }
    SDL_UpdateWindowSurface(m_window);
}

void Program::Handle(const SDL_Event& event) {
    switch (event.type) {
        case SDL_QUIT:
            m_quit = true;
            break;
        case SDL_WINDOWEVENT:
            HandleWindow(event.window);
            break;
        case SDL_MOUSEMOTION:
        case SDL_MOUSEBUTTONDOWN:
        case SDL_MOUSEBUTTONUP:
        case SDL_MOUSEWHEEL:
            HandlePointer(event);
            break;
        case SDL_KEYDOWN:
            HandleKey(event.key);
            break;
        case SDL_TEXTINPUT:
            // Single characters are keys; what an input method composes is not.
            if (event.text.text[0] != '\0' && event.text.text[1] == '\0') {
                const char c = event.text.text[0];
                m_view->KeyDown({static_cast<char32_t>(c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c)});
            }
            break;
        case SDL_DROPFILE:
            OpenFile(event.drop.file);
            SDL_free(event.drop.file);
            break;
        case SDL_AUDIODEVICEADDED:
            LookAfterSound(false);
            break;
        case SDL_AUDIODEVICEREMOVED:
            LoseDevice(event.adevice.which);
            break;
        default:
            break;
    }
}

void Program::HandlePointer(const SDL_Event& event) {
    const auto x = [](int value) { return static_cast<float>(value); };
    const bool left = event.button.button == SDL_BUTTON_LEFT;
    int mouseX = 0, mouseY = 0;
    SDL_GetMouseState(&mouseX, &mouseY);
    const bool shift = (SDL_GetModState() & KMOD_SHIFT) != 0, control = (SDL_GetModState() & KMOD_CTRL) != 0;
    if (event.type == SDL_MOUSEMOTION)
        m_view->PointTo(x(event.motion.x), x(event.motion.y));
    else if (event.type == SDL_MOUSEBUTTONDOWN && (left || event.button.button == SDL_BUTTON_RIGHT))
        m_view->Press(
            {left ? Button::Left : Button::Right, x(event.button.x), x(event.button.y), event.button.clicks});
    else if (event.type == SDL_MOUSEBUTTONUP && left)
        m_view->Release(x(event.button.x), x(event.button.y));
    else if (event.type == SDL_MOUSEWHEEL && (event.wheel.preciseX != 0.0f || shift))
        m_view->ScrollBack(shift ? event.wheel.preciseY : -event.wheel.preciseX);
    else if (event.type == SDL_MOUSEWHEEL)
        m_view->Wheel(x(mouseX), x(mouseY), event.wheel.preciseY, control);
}

void Program::LoseDevice(SDL_AudioDeviceID device) {
    if (m_input->IsGone(device)) m_input->Close();
    if (m_player.IsHeardOn(device)) m_player.Mute();
    if (m_toneDevice == device) {
        CloseTone();
        if (IsToneOn()) SetTone(true);
    }
    LookAfterSound(false);
}

void Program::HandleKey(const SDL_KeyboardEvent& event) {
    const bool control = (event.keysym.mod & KMOD_CTRL) != 0;
    const auto* const found = std::ranges::find(kKeys, event.keysym.sym, &KeyPair::sdl);
    if (found != std::end(kKeys)) {
        if (m_view->KeyDown({found->key, control}) || found->key != kKeyEscape) return;
        if (SDL_GetWindowFlags(m_window) & SDL_WINDOW_FULLSCREEN) ToggleFullScreen();
        return;
    }
    if (!control) return;  // comes as text
    if (event.keysym.sym == SDLK_q || event.keysym.sym == SDLK_w) m_quit = true;
    if (event.keysym.sym < 0x80) m_view->KeyDown({static_cast<char32_t>(event.keysym.sym), true});
}

void Program::HandleWindow(const SDL_WindowEvent& event) {
    switch (event.event) {
        case SDL_WINDOWEVENT_HIDDEN:
        case SDL_WINDOWEVENT_MINIMIZED:
            m_hidden = true;
            break;
        case SDL_WINDOWEVENT_LEAVE:
            m_view->PointerLeft();
            break;
        case SDL_WINDOWEVENT_SHOWN:
        case SDL_WINDOWEVENT_RESTORED:
        case SDL_WINDOWEVENT_MAXIMIZED:
        case SDL_WINDOWEVENT_EXPOSED:
            m_hidden = false;
            m_stale = true;
            break;
        case SDL_WINDOWEVENT_SIZE_CHANGED:
            m_stale = true;
            break;
        default:
            break;
    }
}

std::string Program::Source() const {
    if (m_player.IsOpen()) return m_player.Name() + (m_player.IsHeard() ? "" : " (silent)");
    if (m_options.noAudio) return "No sound (--no-audio)";
    if (!m_input->IsOpen()) return "No input";
    return "Input: " + m_input->Describe();
}

std::vector<std::string> Program::Inputs() const {
    if (!m_hasAudio) return {};
    std::vector<std::string> inputs = Input::Names();
    inputs.insert(inputs.begin(), Input::kSystems);
    return inputs;
}

int Program::CurrentInput() const {
    if (m_player.IsOpen()) return -1;
    if (m_chosenInput.empty()) return 0;
    const auto inputs = Inputs();
    const auto at = std::ranges::find(inputs, m_chosenInput);
    return at == inputs.end() ? -1 : static_cast<int>(at - inputs.begin());
}

void Program::ChooseInput(int index) {
    const auto inputs = Inputs();
    if (index < 0 || index >= static_cast<int>(inputs.size())) return;
    Listen(index == 0 ? "" : inputs[static_cast<std::size_t>(index)]);
}

void Program::Listen(const std::string& name) {
    m_player.Close();
    m_input->Close();
    m_chosenInput = name;
    m_view->StartOver();
    m_input->Want(name);
    LookAfterSound(false);
}

bool Program::Hear(bool inTurn) {
    if (m_options.noAudio || (!m_hasAudio && !StartAudio())) return false;
    const bool plays = m_player.IsOpen(), open = plays ? m_player.IsHeard() : m_input->IsOpen();
    // Where none is listed another try would only make the system complain.
    if (inTurn && !open && SDL_GetNumAudioDevices(plays ? 0 : 1) == 0) return false;
    return plays ? m_player.Hear() : m_input->Open();
}

// `inTurn`: not because something has come or gone.
void Program::LookAfterSound(bool inTurn) {
    const bool plays = m_player.IsOpen();
    const bool works = Hear(inTurn);
    m_wasHeard = m_wasHeard || (plays && works);
    m_view->SetTrouble(works && plays ? "" : Trouble());
    if (m_options.noAudio || !m_hasAudio) return;
    if (works && (plays ? m_player.Get().position > 0.0 : m_input->HasHeard()))
        m_audioDriver = SDL_GetCurrentAudioDriver();
    // What is not there now may come. Another system may be there, too, while none was heard yet.
    const bool hopes = !m_audioDriver.empty() && !plays && !m_input->IsThere();
    if (works || hopes)
        m_failures = 0;
    else if (inTurn)
        ++m_failures;
    // A moment without pictures, and the end of the tone.
    const int most = m_audioDriver.empty() ? kFailuresAtFirst : kFailures;
    if (m_failures >= most && !IsToneOn()) RestartAudio();
}

std::string Program::Trouble() const {
    if (m_player.IsOpen())
        return m_wasHeard && !m_options.noAudio
                   ? "The sound output is gone; the file is heard again as soon as there is one."
                   : "";
    if (m_options.noAudio) return "Nothing is listened to (--no-audio): drop an audio file here.";
    if (!m_hasAudio) return "There is no sound system here; an audio file can be dropped on the window.";
    return m_input->Trouble();
}

// The same system as the one that was heard: another would not have the input that was chosen.
bool Program::StartAudio() {
    if (!m_audioDriver.empty()) SDL_SetHint(SDL_HINT_AUDIODRIVER, m_audioDriver.c_str());
    m_hasAudio = SDL_InitSubSystem(SDL_INIT_AUDIO) == 0;
    return m_hasAudio;
}

// A sound server that was started again is a new one.
void Program::RestartAudio() {
    m_failures = 0;
    m_input->Close();
    m_player.Mute();
    SetTone(false);
    CloseTone();
    SDL_QuitSubSystem(SDL_INIT_AUDIO);
    StartAudio();
}

void Program::OpenFile(const std::string& path) {
    const std::string wrong = m_player.Open(path);
    if (!wrong.empty()) {
        std::fprintf(stderr, "dspdll-analyser: %s\n", wrong.c_str());
        return m_view->Say(wrong);
    }
    m_input->Close();
    m_view->SetSamplingRate(m_player.Rate());
    m_view->StartOver();
    m_wasHeard = false;
    LookAfterSound(false);
    if (!m_options.noAudio && !m_player.IsHeard())
        m_view->Say("There is no sound output: the file is shown silently.");
}

std::optional<Playback> Program::GetPlayback() const {
    if (!m_player.IsOpen()) return std::nullopt;
    return m_player.Get();
}
void Program::Seek(double seconds) {
    if (!m_player.IsOpen()) return;
    m_player.Seek(seconds);
    m_view->StartOver();
}
void Program::TogglePlaying() {
    if (!m_player.IsOpen()) return;
    if (m_player.Get().ended) Seek(0.0);
    m_player.TogglePlaying();
}

void Program::ToggleFullScreen() {
    const bool is = (SDL_GetWindowFlags(m_window) & SDL_WINDOW_FULLSCREEN) != 0;
    SDL_SetWindowFullscreen(m_window, is ? 0 : SDL_WINDOW_FULLSCREEN_DESKTOP);
}

void Program::SetTone(bool on) {
    m_tone.Set(on && m_hasAudio, 4.0 * Tuner::GetCalibrationBase());
    if (!on) return;
    if (!m_toneDevice && m_hasAudio) {
        SDL_AudioSpec wanted = FloatSound(48000, 2, 1024), got{};
        wanted.userdata = this;
        wanted.callback = [](void* program, Uint8* bytes, int count) {
            auto& self = *static_cast<Program*>(program);
            SDL_memset(bytes, 0, static_cast<std::size_t>(count));
            self.m_tone.AddTo(reinterpret_cast<float*>(bytes), count / 8, 2, self.m_toneRate);
        };
        m_toneDevice = SDL_OpenAudioDevice(nullptr, 0, &wanted, &got, SDL_AUDIO_ALLOW_FREQUENCY_CHANGE);
        m_toneRate = got.freq;
        if (m_toneDevice) SDL_PauseAudioDevice(m_toneDevice, 0);
    }
    if (m_toneDevice) return;
    m_tone.Set(false, 440.0);
    m_view->Say("There is no sound output for the reference tone.");
}

void Program::CloseTone() {
    if (m_toneDevice) SDL_CloseAudioDevice(m_toneDevice);
    m_toneDevice = 0;
}

void Program::LoadSettings() {
    std::error_code none;
    if (!std::filesystem::exists(SettingsPath(), none)) return;
    const auto text = ReadWhole(SettingsPath());
    if (text && m_view->SetSettings(*text)) {
        const auto at = text->rfind(kInputLine);
        if (at != text->npos && (at == 0 || (*text)[at - 1] == '\n')) {
            const auto from = at + std::string_view(kInputLine).size();
            m_chosenInput = text->substr(from, text->find('\n', from) - from);
        }
        m_keptChoices = m_view->GetChoices();
        return;
    }
    const std::string sentence =
        SettingsPath().string() + (text ? " is not understood" : " cannot be read") + " and was ignored.";
    std::fprintf(stderr, "dspdll-analyser: %s\n", sentence.c_str());
    m_view->Say(sentence);
}

void Program::KeepSettings() {
    if (m_view->GetChoices() == m_keptChoices) return;
    m_keptChoices = m_view->GetChoices();
    const std::string input = m_chosenInput.empty() ? "" : kInputLine + m_chosenInput + "\n";
    if (!WriteWhole(SettingsPath(), m_view->GetSettings() + input))
        m_view->Say("What is chosen cannot be kept: " + SettingsPath().string() + " cannot be written.");
}

}  // namespace analyser
