#include "Input.h"

#include "FloatSound.h"

#include <algorithm>
#include <string_view>
#include <utility>

namespace analyser {
namespace {

constexpr int kRefreshes = 30, kPause = 8;  // refreshes that may pass between two blocks

// Without the " (2)" of a second device of a name, and of one that was plugged in again.
std::string_view Unnumbered(std::string_view name) {
    const auto at = name.rfind(" (");
    const bool numbered = at != name.npos && name.back() == ')' &&
                          name.find_first_not_of("0123456789", at + 2) == name.size() - 1;
    return numbered ? name.substr(0, at) : name;
}

// What the system would choose, where SDL can tell.
std::string DefaultName() {
    std::string name;
#if SDL_VERSION_ATLEAST(2, 24, 0)
    char* text = nullptr;
    SDL_AudioSpec spec{};
    if (SDL_GetDefaultAudioInfo(&text, &spec, 1) == 0 && text) name = text;
    SDL_free(text);
#endif
    return name;
}

}  // namespace

std::vector<std::string> Input::Names() {
    std::vector<std::string> names;
    const int count = SDL_GetNumAudioDevices(1);
    for (int i = 0; i < count; ++i)
        if (const char* const name = SDL_GetAudioDeviceName(i, 1)) names.emplace_back(name);
    return names;
}

void Input::Take(void* input, Uint8* bytes, int count) {
    auto& self = *static_cast<Input*>(input);
    const int frames = count / static_cast<int>(sizeof(float)) / self.m_channels;
    self.m_view.Feed(reinterpret_cast<const float*>(bytes), frames, self.m_channels);
    self.m_blocks.fetch_add(1, std::memory_order_relaxed);
}

// Empty when it is not there.
std::string Input::Present() const {
    const auto names = Names();
    if (std::ranges::find(names, m_wanted) != names.end()) return m_wanted;
    const auto alike = std::ranges::find(names, Unnumbered(m_wanted), Unnumbered);
    return alike != names.end() ? *alike : std::string();
}

bool Input::IsThere() const { return m_wanted.empty() || !Present().empty(); }

std::string Input::Describe() const {
    const std::string name = !m_wanted.empty()   ? m_wanted
                             : m_systems.empty() ? kSystems
                                                 : kSystems + (" (" + m_systems + ")");
    return name + ", " + std::to_string(m_rate) + " Hz";
}

void Input::KeepTime() {
    const unsigned blocks = m_blocks.load(std::memory_order_relaxed);
    const bool came = std::exchange(m_blocksBefore, blocks) != blocks;
    m_stillFor = came ? 0 : m_stillFor + 1;
    if (m_stillFor < kPause || m_rate == 0) return;
    m_silence.resize(static_cast<std::size_t>(m_rate / kRefreshes));
    SDL_LockAudioDevice(m_device);  // one feeds at a time
    m_view.Feed(m_silence.data(), static_cast<int>(m_silence.size()), 1);
    SDL_UnlockAudioDevice(m_device);
}

bool Input::Want(const std::string& name) {
    m_wanted = name;
    Close();
    return Retry();
}

bool Input::Retry() {
    if (m_wanted.empty()) m_systems = DefaultName();
    if (m_device) return true;
    const std::string name = m_wanted.empty() ? "" : Present();
    // Where none is listed none is asked for: that would only make the system complain.
    if ((name.empty() && !m_wanted.empty()) || SDL_GetNumAudioDevices(1) == 0) return false;
    SDL_AudioSpec wanted = FloatSound(48000, 2, 512), got{};
    wanted.callback = Take;
    wanted.userdata = this;
    m_device = SDL_OpenAudioDevice(name.empty() ? nullptr : name.c_str(), 1, &wanted, &got,
                                   SDL_AUDIO_ALLOW_FREQUENCY_CHANGE | SDL_AUDIO_ALLOW_CHANNELS_CHANGE);
    if (!m_device) {
        m_error = SDL_GetError();
        return false;
    }
    m_rate = got.freq;
    m_channels = std::max<int>(got.channels, 1);
    m_view.SetSamplingRate(m_rate);
    m_stillFor = 0;
    SDL_PauseAudioDevice(m_device, 0);
    return true;
}

void Input::Close() {
    if (m_device) SDL_CloseAudioDevice(m_device);
    m_device = 0;
}

std::string Input::Trouble() const {
    if (m_device)
        return m_stillFor < kRefreshes
                   ? ""
                   : "Nothing comes from the sound input; it is heard as soon as something does.";
    if (!IsThere()) return "\"" + m_wanted + "\" is not there; it is heard as soon as it is plugged in.";
    if (SDL_GetNumAudioDevices(1) == 0)
        return "There is no sound input: plug one in, or drop an audio file here.";
    return "The sound input cannot be opened (" + m_error + "); another try is made all the time.";
}

}  // namespace analyser
