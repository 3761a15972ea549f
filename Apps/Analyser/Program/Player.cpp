#include "Player.h"

#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <filesystem>

#include "FloatSound.h"

namespace analyser {
namespace {

constexpr int kRefreshes = 30;
constexpr int kMostChannels = 64, kLowestRate = 1000, kHighestRate = 768000;
constexpr int kMostOutputs = 2;
// Outputs take their sound in lumps: so many thirtieths of a second the picture may be behind what they took.
constexpr int kMostLate = 10;
constexpr double kMissed = 0.1;  // seconds that a file is shorter than it says

}  // namespace

std::string Player::Open(const std::string& path) {
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
    m_path = path;
    m_name = name;
    GoTo(0);
    m_playing = true;
    return {};
}

void Player::Close() {
    Mute();
    m_file.reset();
    m_playing = false;
}

bool Player::Hear() {
    if (m_device) return true;
    if (!m_file) return false;
    const SDL_AudioSpec wanted = FloatSound(m_info.samplerate, static_cast<int>(Outputs()), 1024);
    m_device = SDL_OpenAudioDevice(nullptr, 0, &wanted, nullptr, 0);
    if (!m_device) return false;
    if (m_playing) GoTo(Position());
    SDL_PauseAudioDevice(m_device, m_playing ? 0 : 1);
    return true;
}

void Player::Mute() {
    if (!m_device) return;
    SDL_CloseAudioDevice(m_device);
    m_device = 0;
    if (m_playing) GoTo(Position());
}

Playback Player::Get() const {
    const double rate = m_info.samplerate;
    const bool ended = !m_playing && ((m_atEnd && m_ahead.empty()) || Position() >= m_info.frames);
    return {static_cast<double>(Position()) / rate, static_cast<double>(m_info.frames) / rate, m_playing,
            m_waits, ended};
}

void Player::Seek(double seconds) {
    const auto frame = static_cast<std::int64_t>(std::max(seconds, 0.0) * m_info.samplerate);
    GoTo(std::min<std::int64_t>(frame, m_info.frames));
}

void Player::GoTo(std::int64_t frame) {
    if (!m_file) return;
    m_start = sf_seek(m_file.get(), frame, SEEK_SET);
    if (m_start < 0) Reopen();
    m_read = m_fed = m_steps = m_silent = 0;
    m_atEnd = m_waits = false;
    m_ahead.clear();
    if (m_device) SDL_ClearQueuedAudio(m_device);
}

// Behind the end of a file that was cut off its reader gets lost.
void Player::Reopen() {
    SF_INFO now{};
    SNDFILE* const again = sf_open(m_path.c_str(), SFM_READ, &now);
    if (again && now.channels == m_info.channels && now.samplerate == m_info.samplerate)
        m_file.reset(again);
    else if (again)  // another file has its name by now
        sf_close(again);
    m_start = 0;
}

void Player::TogglePlaying() {
    if (!m_file || Get().ended) return;
    // Counted anew, or the time of the pause would be caught up with.
    if (!m_playing) GoTo(Position());
    m_playing = !m_playing;
    if (m_device) SDL_PauseAudioDevice(m_device, m_playing ? 0 : 1);
}

std::size_t Player::Outputs() const {
    return m_info.channels <= kMostOutputs ? static_cast<std::size_t>(m_info.channels) : 1;
}

// Into m_block; fewer at the end, with silence behind them.
int Player::Read(int frames) {
    m_block.assign(static_cast<std::size_t>(frames) * static_cast<std::size_t>(m_info.channels), 0.0f);
    const auto got =
        static_cast<int>(std::max<sf_count_t>(sf_readf_float(m_file.get(), m_block.data(), frames), 0));
    if (got < frames) m_atEnd = true;
    m_read += got;
    return got;
}

// A fifth of a second ahead of what is heard.
void Player::Queue() {
    const auto channels = static_cast<std::size_t>(m_info.channels);
    const std::size_t outputs = Outputs();
    const auto waiting = static_cast<int>(SDL_GetQueuedAudioSize(m_device) / (sizeof(float) * outputs));
    const int wanted = m_info.samplerate / 5 - waiting;
    if (m_atEnd || wanted <= 0) return;
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
}

// Frames that the output took and the view has not got yet.
std::int64_t Player::Taken() const {
    return m_read - m_fed -
           static_cast<std::int64_t>(SDL_GetQueuedAudioSize(m_device) / (sizeof(float) * Outputs()));
}

// Into m_block, with silence behind the end.
int Player::Next(int frames) {
    if (!m_device) return Read(frames);
    const std::size_t channels = static_cast<std::size_t>(m_info.channels);
    const std::size_t got = std::min(m_ahead.size(), static_cast<std::size_t>(frames) * channels);
    const auto end = m_ahead.begin() + static_cast<std::ptrdiff_t>(got);
    m_block.assign(static_cast<std::size_t>(frames) * channels, 0.0f);
    std::copy(m_ahead.begin(), end, m_block.begin());
    m_ahead.erase(m_ahead.begin(), end);
    return static_cast<int>(got / channels);
}

void Player::End(View& view) {
    m_playing = false;
    const Playback at = Get();
    if (at.length - at.position < kMissed) return;
    char text[80];
    std::snprintf(text, sizeof text, " ends at %.1f of %.1f s: the rest cannot be read.", at.position,
                  at.length);
    view.Say("\"" + m_name + "\"" + text);
    m_info.frames = Position();
}

void Player::Step(View& view) {
    if (!m_file || !m_playing) return;
    const int half = kivspectrum::GetSettings().window_length / 2;
    if (m_atEnd && m_ahead.empty() && m_silent >= half) return End(view);
    if (m_device) {
        Queue();
        const std::int64_t late = (m_fed + Taken()) * kRefreshes / m_info.samplerate - m_steps;
        if (late > kMostLate) m_steps += late - kMostLate;
    }
    const auto due = static_cast<int>((m_steps + 1) * m_info.samplerate / kRefreshes - m_fed - m_silent);
    // The picture waits for the output, or it would fill with a silence that is not the file's.
    m_waits = m_device && Taken() < due && !(m_atEnd && SDL_GetQueuedAudioSize(m_device) == 0);
    if (m_waits) return;
    ++m_steps;
    const int got = Next(due);
    // Until the end stands in the middle of the window.
    const int silent = m_atEnd && m_ahead.empty() ? std::clamp(due - got, 0, half - m_silent) : 0;
    view.Feed(m_block.data(), got + silent, m_info.channels);
    m_fed += got;
    m_silent += silent;
    // The middle of the newest window stands at the right edge.
    const auto middle = static_cast<double>(Position() + m_silent - half);
    view.SetTime(std::max(middle / m_info.samplerate, 0.0));
}

}  // namespace analyser
