#include "Input.h"

#include "FloatSound.h"

#include <algorithm>

namespace analyser {

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
}

bool Input::Want(const std::string& name) {
    m_wanted = name;
    Close();
    return Retry();
}

bool Input::Retry() {
    if (m_device) return true;
    SDL_AudioSpec wanted = FloatSound(48000, 2, 512), got{};
    wanted.callback = Take;
    wanted.userdata = this;
    m_device = SDL_OpenAudioDevice(m_wanted.empty() ? nullptr : m_wanted.c_str(), 1, &wanted, &got,
                                   SDL_AUDIO_ALLOW_FREQUENCY_CHANGE | SDL_AUDIO_ALLOW_CHANNELS_CHANGE);
    if (!m_device) {
        m_error = SDL_GetError();
        return false;
    }
    m_rate = got.freq;
    m_channels = std::max<int>(got.channels, 1);
    m_view.SetSamplingRate(m_rate);
    SDL_PauseAudioDevice(m_device, 0);
    return true;
}

void Input::Close() {
    if (m_device) SDL_CloseAudioDevice(m_device);
    m_device = 0;
}

std::string Input::Trouble() const {
    if (m_device) return {};
    if (!m_wanted.empty()) {
        const auto names = Names();
        if (std::ranges::find(names, m_wanted) == names.end())
            return "\"" + m_wanted + "\" is not there; it is heard as soon as it is plugged in.";
    } else if (SDL_GetNumAudioDevices(1) == 0) {
        return "There is no sound input: plug one in, or drop an audio file here.";
    }
    return "The sound input cannot be opened (" + m_error + "); another try is made all the time.";
}

}  // namespace analyser
