#pragma once

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <vector>

// What the checks see of a plug-in, whatever its format.
namespace PluginHost {

using Bytes = std::vector<char>;

struct Parameter {
    std::uint32_t id;
    std::string name;
    double minimum, maximum, initial;
    int steps;  // one less than it has values; 0 where it is continuous
    bool readOnly, automatable, bypass, hidden;

    double At(double part) const;  // the value at 0..1 of the range, a whole step where it has steps
};

struct Port {
    std::string name;
    int channels;
    bool main;
};

struct Change {
    std::uint32_t parameter;
    double value;
    std::uint32_t frame;
};

// Channels of all ports in their order. An output may be the memory of the input with its number.
struct Block {
    std::span<float*const> inputs, outputs;
    std::uint32_t frames;
    std::span<const Change> changes;
};

// Notes what is wrong with the plug-in at hand. Printed at once; what differs only in its digits, only once.
void Finding(const std::string& text);
inline void Expect(bool condition, const std::string& otherwise) {
    if (!condition) Finding(otherwise);
}

// Whether the plug-in at hand neither allocates nor waits while it processes; where a format can say so, it
// does.
bool IsRealTime();

enum class Thread { Main, Audio };
Thread CurrentThread();
// Runs the work on a thread of its own that counts as the audio thread, and waits for it.
void OnAudioThread(const std::function<void()>& work);

// A state on its way, so many bytes per call at most.
struct Stream {
    const void* table = nullptr;  // where a format's streams begin with one
    Bytes bytes = {};
    std::size_t most = 1 << 30, position = 0;

    std::int64_t Read(void* buffer, std::int64_t size);
    std::int64_t Write(const void* buffer, std::int64_t size);
};

// A plug-in's window. Deleting it closes it.
class Window {
public:
    virtual ~Window() = default;
    virtual bool Open(std::uintptr_t parent) = 0;  // inside of this X11 window
    virtual bool Resize(int width, int height) = 0;
    virtual void Tick() = 0;  // of the host's timers
};

// One plug-in in the host. All calls belong to the main thread, but for Process, Reset and FlushActive.
class Instance {
public:
    virtual ~Instance() = default;

    std::vector<Parameter> parameters;
    std::vector<Port> inputs, outputs;
    std::vector<std::string> presets;  // names
    double tempo = 120;                // in beats per minute

    // Where the format leaves the texts to the host, there are none to check.
    virtual bool HasTexts() const { return true; }
    virtual std::optional<std::string> Text(const Parameter&, double) { return {}; }
    virtual std::optional<double> Value(const Parameter&, const std::string&) { return {}; }
    virtual double Get(const Parameter&) = 0;
    virtual bool TakePreset(std::size_t) { return false; }

    Bytes Save(Stream stream = {}) { return SaveTo(stream) ? stream.bytes : Bytes{}; }
    virtual bool SaveTo(Stream&) = 0;
    virtual bool Load(Stream) = 0;

    virtual bool Activate(double rate, std::uint32_t maxFrames) = 0;
    virtual void Deactivate() = 0;
    virtual std::uint32_t Latency() = 0;
    // How often the host was told since that the latency is another. It has heard the plug-in out.
    virtual int TakeLatencyNews() = 0;

    // While inactive.
    virtual void Flush(std::span<const Change> changes) {
        Expect(Activate(48000, 64), "cannot be activated");
        OnAudioThread([&] { FlushActive(changes); });
        Deactivate();
    }
    virtual bool Process(const Block&) = 0;
    // Without audio.
    virtual void FlushActive(std::span<const Change> changes) { Process({{}, {}, 0, changes}); }
    virtual void Reset() = 0;

    // One channel everywhere, or two; false when the plug-in has no such layout. While inactive.
    virtual bool SetChannels(int channels) { return outputs.front().channels == channels; }
    virtual std::unique_ptr<Window> MakeWindow() { return nullptr; }  // null where it has none

    // The plug-in's own rules for this format, such as what events it must leave alone.
    virtual void CheckFormat() {}
};

// A file of a format. Loading it checks what it says of itself.
class PluginFile {
public:
    virtual ~PluginFile() = default;
    virtual std::size_t Count() const = 0;
    virtual std::string Name(std::size_t index) const = 0;
    virtual std::vector<std::string> Texts(std::size_t index) const = 0;  // none may be empty
    virtual std::unique_ptr<Instance> Create(std::size_t index) = 0;
};

// Throw std::runtime_error where there is nothing to check.
std::unique_ptr<PluginFile> OpenLv2(const std::filesystem::path& bundle);
std::unique_ptr<PluginFile> OpenClap(const std::filesystem::path&);
std::unique_ptr<PluginFile> OpenVst3(const std::filesystem::path&);

}  // namespace PluginHost
