#include "Player.h"

#include <algorithm>
#include <cstddef>
#include <filesystem>

#include "FloatSound.h"

namespace analyser {
namespace {

constexpr int kRefreshes = 30;
constexpr int kMostChannels = 64, kLowestRate = 1000, kHighestRate = 768000;
constexpr int kMostOutputs = 2;

}  // namespace

std::string Player::Open(const std::string& path, bool sound) {
    const std::string name = std::filesystem::path(path).filename().string();
    SF_INFO info{};
    std::unique_ptr<SNDFILE, Closer> file(sf_open(path.c_str(), SFM_READ, &info));
    if (!file) return "\"" + name + "\" cannot be played: " + sf_strerror(nullptr);
    if (info.channels < 1 || info.channels > kMostChannels || info.samplerate < kLowestRate ||
        info.samplerate > kHighestRate || info.frames < 1 || !info.seekable)
        return "\"" + name + "\" cannot be played: nothing in it that can be heard.";
    Close();
    m_file = std::move(file);
    m_info = info;
    m_name = name;
    if (sound) {
        const SDL_AudioSpec wanted =
            FloatSound(info.samplerate, info.channels <= kMostOutputs ? info.channels : 1, 1024);
        m_device = SDL_OpenAudioDevice(nullptr, 0, &wanted, nullptr, 0);
    }
    Seek(0.0);
    m_playing = true;
    if (m_device) SDL_PauseAudioDevice(m_device, 0);
    return {};
}

void Player::Close() {
    if (m_device) SDL_CloseAudioDevice(m_device);
    m_device = 0;
    m_file.reset();
    m_playing = false;
}

Playback Player::Get() const {
    const double rate = m_info.samplerate;
    return {static_cast<double>(m_start + m_fed) / rate, static_cast<double>(m_info.frames) / rate,
            m_playing};
}

void Player::Seek(double seconds) {
    if (!m_file) return;
    const auto frame = static_cast<std::int64_t>(std::max(seconds, 0.0) * m_info.samplerate);
    m_start = std::max<std::int64_t>(
        sf_seek(m_file.get(), std::min<std::int64_t>(frame, m_info.frames), SEEK_SET), 0);
    m_steps = m_fed = m_queued = 0;
    m_ended = false;
    m_ahead.clear();
    if (m_device) SDL_ClearQueuedAudio(m_device);
}

void Player::TogglePlaying() {
    if (!m_file) return;
    if (!m_playing && m_start + m_fed >= m_info.frames) Seek(0.0);
    // Counted anew, or the time of the pause would be caught up with.
    if (!m_playing) Seek(Get().position);
    m_playing = !m_playing;
    if (m_device) SDL_PauseAudioDevice(m_device, m_playing ? 0 : 1);
}

// Into m_block; fewer at the end.
int Player::Read(int frames) {
    m_block.resize(static_cast<std::size_t>(frames) * static_cast<std::size_t>(m_info.channels));
    const auto got =
        static_cast<int>(std::max<sf_count_t>(sf_readf_float(m_file.get(), m_block.data(), frames), 0));
    if (got < frames) m_ended = true;
    return got;
}

// A fifth of a second ahead of what is heard.
void Player::Queue() {
    const auto channels = static_cast<std::size_t>(m_info.channels);
    const std::size_t outputs = m_info.channels <= kMostOutputs ? channels : 1;
    const auto waiting = static_cast<int>(SDL_GetQueuedAudioSize(m_device) / (sizeof(float) * outputs));
    const int wanted = m_info.samplerate / 5 - waiting;
    if (m_ended || wanted <= 0) return;
    const auto got = static_cast<std::size_t>(Read(wanted));
    const auto samples = static_cast<std::ptrdiff_t>(got * channels);
    m_ahead.insert(m_ahead.end(), m_block.begin(), m_block.begin() + samples);
    if (outputs != channels)
        for (std::size_t i = 0; i < got; ++i) {
            float sum = 0.0f;
            for (std::size_t c = 0; c < channels; ++c) sum += m_block[i * channels + c];
            m_block[i] = sum / static_cast<float>(channels);
        }
    SDL_QueueAudio(m_device, m_block.data(), static_cast<Uint32>(got * outputs * sizeof(float)));
    m_queued += static_cast<std::int64_t>(got);
}

void Player::Step(View& view) {
    if (!m_file || !m_playing) return;
    const int channels = m_info.channels;
    if (m_device) {
        Queue();
        const std::size_t outputs = channels <= kMostOutputs ? static_cast<std::size_t>(channels) : 1;
        const std::int64_t waiting = SDL_GetQueuedAudioSize(m_device) / (sizeof(float) * outputs);
        const std::int64_t due = std::max<std::int64_t>(m_queued - waiting - m_fed, 0);
        m_block.assign(m_ahead.begin(), m_ahead.begin() + static_cast<std::ptrdiff_t>(due * channels));
        m_ahead.erase(m_ahead.begin(), m_ahead.begin() + static_cast<std::ptrdiff_t>(due * channels));
        view.Feed(m_block.data(), static_cast<int>(due), channels);
        m_fed += due;
        if (m_ended && m_ahead.empty()) m_playing = false;
    } else {
        ++m_steps;
        const int got = Read(static_cast<int>(m_steps * m_info.samplerate / kRefreshes - m_fed));
        view.Feed(m_block.data(), got, channels);
        m_fed += got;
        if (m_ended) m_playing = false;
    }
    // The middle of the newest window stands at the right edge.
    const double half = kivspectrum::GetSettings().window_length / 2.0 / m_info.samplerate;
    view.SetTime(std::max(Get().position - half, 0.0));
}

}  // namespace analyser
