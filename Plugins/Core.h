#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "Ports.h"
#include "Window.h"

namespace Corvo::Plugins {

// What a plug-in is, whatever its format: ports in plain numbers, planar floats, a bypass, its state as
// bytes, perhaps a window. Each format's shell is made of one of these. What a plug-in has nothing of need
// not be overridden.
//
// Threads: Set, Bypass, Tempo and Run belong to the thread that processes; while nothing is processed any one
// thread may call them. Everything else belongs to another thread, and may be called while Run runs, except
// Prepare. Reset belongs to either, while nothing is processed. Run and Reset neither allocate nor wait,
// unless the plug-in's own row says that they may.
class Core {
public:
    virtual ~Core() = default;
    Core(const Core&) = delete;
    Core& operator=(const Core&) = delete;

    const PluginRow& Row() const { return m_row; }
    const std::vector<Port>& Ports() const { return m_layout.ports; }
    const std::vector<std::string>& Groups() const { return m_layout.groups; }
    int Channels() const { return m_channels; }
    virtual int SideChannels() const { return 0; }  // of the side-chain; 0 without one
    // 1 or 2 channels from the next preparation on; nothing is processed until then. The ports stay.
    virtual void SetChannels(int channels) { m_channels = channels; }

    // Makes all memory, for blocks of about `frames`; longer ones are cut. Throws std::bad_alloc.
    virtual void Prepare(double rate, int frames) = 0;
    virtual void Reset() {}  // silence, as after Prepare

    // The value that a host reads back; NaN and what is no other value are ignored, and so are outputs. A
    // continuous port glides to it over some milliseconds while sound is processed.
    virtual void Set(int, float) {}
    virtual float Value(int port) const = 0;  // any thread
    // After TakeState: one value per port, as the host had set them. The effect may store numbers more
    // coarsely than a host sets them: where such a value means what the effect has now, Value gives it back.
    virtual void Recall(const std::vector<float>&) {}
    // Over 20 ms from the effect to its delayed input, or back.
    void Bypass(bool on) { m_bypass = on; }
    bool Bypassed() const { return m_bypass; }
    virtual void Tempo(double /*bpm*/, int /*numerator*/, int /*denominator*/) {}

    // One block of any length, 0 included. Buffers may be the same in any combination. `side` may be null,
    // and counts as absent until something else than silence came from it. Samples that are not finite count
    // as 0.
    virtual void Run(const float* const* in, float* const* out, const float* const* side, int frames) = 0;
    virtual int Latency() const { return 0; }  // in frames; of the last block or preparation

    // The settings chunk.
    virtual std::vector<std::uint8_t> State() = 0;
    // False, with nothing changed, for bytes that the plug-in does not take.
    virtual bool TakeState(const std::vector<std::uint8_t>& bytes) = 0;
    virtual int Presets() { return 0; }
    virtual std::string PresetName(int) { return {}; }
    virtual int StartPreset() { return 0; }  // that a new instance has
    virtual void TakePreset(int) {}
    // Whether values changed that the host did not set (any thread); taking it forgets it.
    virtual bool HasOtherValues() const { return false; }
    virtual bool TakeOtherValues() { return false; }

    virtual std::string Text(int port, float value);
    virtual bool FromText(int port, const std::string& text, float& value);

    virtual bool HasWindow() const { return false; }
    // Null without a display. It must not outlive this.
    virtual std::unique_ptr<Window> MakeWindow() { return nullptr; }

protected:
    Core(const PluginRow& row, int channels, const Layout& layout)
        : m_row(row), m_layout(layout), m_channels(channels) {}

private:
    const PluginRow& m_row;
    const Layout& m_layout;
    int m_channels;
    std::atomic<bool> m_bypass{false};
};

// Whose the values of the ports are. Of the plug-in: a list may move other values with it, and the host is
// told. Of the host, where a format cannot tell it: the others stay as it set them.
enum class Values { OfPlugin, OfHost };

// A plug-in of the file's table, for 1 or 2 channels. Throws std::bad_alloc.
std::unique_ptr<Core> MakeCore(const PluginRow& row, int channels, Values values = Values::OfPlugin);
// The names of the factory presets, in less time than a plug-in takes to make. Throws std::bad_alloc.
std::vector<std::string> PresetNamesOf(const PluginRow& row);

}  // namespace Corvo::Plugins
