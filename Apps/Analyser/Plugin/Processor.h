#pragma once

#include <atomic>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "Shell.h"
#include "Tone.h"
#include "View.h"

namespace analyser {

// What a plug-in hears and what its window shows. The audio thread feeds; a thread of its own refreshes the
// view 30 times a second, whether or not there is a window, so that the notes are published; windows and
// hosts use the view while they hold it.
class Processor : public Shell {
public:
    Processor();
    ~Processor() override;
    Processor(const Processor&) = delete;
    Processor& operator=(const Processor&) = delete;

    // Audio thread; one channel or two. `outputs` get the inputs' samples to the bit unless the reference
    // tone is asked for, and 0 for what is not finite; they may be the inputs. Nothing is heard while
    // bypassed.
    void Process(const float* const* inputs, float* const* outputs, int channels, int frames, bool bypassed);
    // What the tuner shows; 0 frequency and note -1 without one. Any thread.
    const Tuner& GetTuner() const { return *m_view.GetAnalyser().GetTuner(); }
    bool IsTunerOn() const { return m_view.GetAnalyser().GetTunerOn(); }
    // dB of the highest sample, which falls by 20 dB a second. Any thread.
    float GetLevel() const { return m_level.load(std::memory_order_relaxed); }

    // Not on the audio thread: the view, for as long as what is returned lives.
    class Hold {
    public:
        explicit Hold(Processor& processor) : m_lock(processor.m_mutex), m_view(processor.m_view) {}
        View* operator->() { return &m_view; }

    private:
        std::unique_lock<std::mutex> m_lock;
        View& m_view;
    };
    void SetRate(double rate);
    // Counts up when the picture changes by itself.
    unsigned Changes() const { return m_changes; }
    // Windows come with their clipboards, of which the latest serves all. The reference tone goes with the
    // last window.
    using Clipboard = std::function<bool(const std::string&)>;
    void AddWindow(const void* window, Clipboard copy);
    void RemoveWindow(const void* window);
    // Which of them the view was drawn for last: places are places of that picture. The windows' thread.
    void SetDrawn(const void* window) { m_drawnFor = window; }
    bool IsDrawnFor(const void* window) const { return m_drawnFor == window; }

    std::string Source() const override;
    bool Copy(const std::string& text) override {
        return !m_windows.empty() && m_windows.back().second(text);
    }
    bool IsToneOn() const override { return m_tone.IsOn(); }
    void SetTone(bool on) override;

private:
    void Refresh();

    Tone m_tone;
    std::vector<std::pair<const void*, Clipboard>> m_windows;
    const void* m_drawnFor = nullptr;
    std::atomic<float> m_level{-120.0f};
    std::atomic<unsigned> m_changes{0};
    std::atomic<double> m_rate{48000.0};
    View m_view;
    std::mutex m_mutex;
    std::condition_variable m_end;
    bool m_ended = false;
    std::thread m_thread;  // last: it uses all of the others
};

}  // namespace analyser
