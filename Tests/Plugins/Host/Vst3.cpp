// VST3 over the C description of its interfaces.
#include <travesty/audio_processor.h>
#include <travesty/component.h>
#include <travesty/edit_controller.h>
#include <travesty/factory.h>
#include <travesty/host.h>
#include <travesty/unit.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <stdexcept>
#include <utility>

#include "Formats.h"
#include "Module.h"
#include "Vst3Object.h"
#include "Vst3Window.h"

namespace PluginHost {
namespace {

std::string Narrow(const std::int16_t* text) {
    std::string narrow;
    for (; *text; ++text) narrow += static_cast<char>(*text);  // ours are ASCII
    return narrow;
}

Table<v3_host_application, v3_host_application_iid> g_application(
    {[](void*, v3_str_128 name) -> v3_result { return name[0] = 'h', name[1] = 0, V3_OK; },
     [](void*, v3_tuid, v3_tuid, void**) -> v3_result { return V3_NOT_IMPLEMENTED; }});

v3_result OnMainThread(const char* call) {
    Expect(CurrentThread() == Thread::Main,
           std::string("calls the host's ") + call + " from the wrong thread");
    return V3_OK;
}
bool g_choosing = false;  // a program; hosts deadlock on a restart then
int g_restarts = 0;       // for another latency
Table<v3_component_handler, v3_component_handler_iid> g_handler(
    {[](void*, v3_param_id) { return OnMainThread("begin_edit"); },
     [](void*, v3_param_id, double) { return OnMainThread("perform_edit"); },
     [](void*, v3_param_id) { return OnMainThread("end_edit"); },
     [](void*, std::int32_t flags) {
         g_restarts += (flags & V3_RESTART_LATENCY_CHANGED) != 0;
         Expect(!g_choosing, "calls restart_component while a program is chosen");
         return OnMainThread("restart_component");
     }});

// Ours read and write from one end to the other.
Stream& StreamOf(void* self) { return *static_cast<Stream*>(self); }
Table<v3_bstream, v3_bstream_iid> g_stream(
    {[](void* self, void* buffer, std::int32_t size, std::int32_t* done) -> v3_result {
         *done = static_cast<std::int32_t>(StreamOf(self).Read(buffer, size));
         return V3_OK;
     },
     [](void* self, void* buffer, std::int32_t size, std::int32_t* done) -> v3_result {
         *done = static_cast<std::int32_t>(StreamOf(self).Write(buffer, size));
         return V3_OK;
     },
     [](void*, std::int64_t, std::int32_t, std::int64_t*) -> v3_result { return V3_NOT_IMPLEMENTED; },
     [](void*, std::int64_t*) -> v3_result { return V3_NOT_IMPLEMENTED; }});

// The changes of one block: a queue per parameter, all made beforehand.
using QueueTable = Table<v3_param_value_queue, v3_param_value_queue_iid>;
struct Queue {
    QueueTable* table;
    v3_param_id id = 0;
    std::vector<Change> points;

    static Queue& Of(void* self) { return *static_cast<Queue*>(self); }
    bool Add(double value, std::uint32_t frame) {
        if (points.size() == points.capacity()) return false;
        points.push_back({id, value, frame});
        return true;
    }
};
QueueTable g_queue({[](void* self) { return Queue::Of(self).id; },
                    [](void* self) { return static_cast<std::int32_t>(Queue::Of(self).points.size()); },
                    [](void* self, std::int32_t index, std::int32_t* frame, double* value) -> v3_result {
                        const Change& point = Queue::Of(self).points.at(static_cast<std::size_t>(index));
                        *frame = static_cast<std::int32_t>(point.frame);
                        *value = point.value;
                        return V3_OK;
                    },
                    [](void* self, std::int32_t frame, double value, std::int32_t* index) -> v3_result {
                        if (!(value >= 0 && value <= 1)) Finding("sends a value outside of 0..1");
                        *index = 0;
                        return Queue::Of(self).Add(value, static_cast<std::uint32_t>(frame)) ? V3_OK
                                                                                             : V3_FALSE;
                    }});
using ChangesTable = Table<v3_param_changes, v3_param_changes_iid>;
struct Changes {
    ChangesTable* table;
    std::vector<Queue> queues;
    std::size_t used = 0;

    static Changes& Of(void* self) { return *static_cast<Changes*>(self); }
    Queue* QueueOf(v3_param_id id) {  // null when all are in use
        std::size_t i = 0;
        while (i < used && queues[i].id != id) ++i;
        if (i == queues.size()) return nullptr;
        used = std::max(used, i + 1);
        queues[i].id = id;
        return &queues[i];
    }
    void Set(std::span<const Change> changes) {
        for (std::size_t i = 0; i < used; ++i) queues[i].points.clear();
        used = 0;
        for (const Change& change : changes)
            if (Queue* const queue = QueueOf(change.parameter)) queue->Add(change.value, change.frame);
    }
};
ChangesTable g_changes({[](void* self) { return static_cast<std::int32_t>(Changes::Of(self).used); },
                        [](void* self, std::int32_t index) {
                            Queue& queue = Changes::Of(self).queues[static_cast<std::size_t>(index)];
                            return reinterpret_cast<v3_param_value_queue**>(&queue);
                        },
                        [](void* self, v3_param_id* id, std::int32_t* index) {
                            Queue* const queue = Changes::Of(self).QueueOf(*id);
                            *index = queue
                                         ? static_cast<std::int32_t>(queue - Changes::Of(self).queues.data())
                                         : 0;
                            return reinterpret_cast<v3_param_value_queue**>(queue);
                        }});

constexpr std::size_t kQueues = 512, kPoints = 64;

class Vst3Instance : public Instance {
public:
    Vst3Instance(v3_plugin_factory** factory, const v3_tuid id) : m_component(Create(factory, id)) {
        const auto context = reinterpret_cast<v3_funknown**>(&g_application.itself);
        if (v3_cpp_obj_initialize(m_component.Get(), context) != V3_OK)
            throw std::runtime_error("initialize fails");
        // Ours are one object.
        if (!m_processor || !m_controller) throw std::runtime_error("has no processor or no controller");
        m_controller->set_component_handler(m_controller.Get(),
                                            reinterpret_cast<v3_component_handler**>(&g_handler.itself));
        for (Changes* changes : {&m_in, &m_out}) {
            changes->queues.resize(kQueues, Queue{&g_queue, 0, {}});
            for (Queue& queue : changes->queues) queue.points.reserve(kPoints);
        }
        ReadParameters();
        ReadPrograms();
        ReadPorts();
    }
    ~Vst3Instance() override { v3_cpp_obj_terminate(m_component.Get()); }

    std::optional<std::string> Text(const Parameter& parameter, double value) override {
        v3_str_128 text{};
        const auto result =
            m_controller->get_parameter_string_for_value(m_controller.Get(), parameter.id, value, text);
        return result == V3_OK ? std::optional(Narrow(text)) : std::nullopt;
    }
    std::optional<double> Value(const Parameter& parameter, const std::string& text) override {
        v3_str_128 wide{};
        std::copy(text.begin(), text.end(), wide);
        double value = 0;
        const auto result =
            m_controller->get_parameter_value_for_string(m_controller.Get(), parameter.id, wide, &value);
        return result == V3_OK ? std::optional(value) : std::nullopt;
    }
    double Get(const Parameter& parameter) override {
        return m_controller->get_parameter_normalised(m_controller.Get(), parameter.id);
    }

    bool TakePreset(std::size_t preset) override {
        g_choosing = true;
        const double place = static_cast<double>(preset) / std::max(m_program.step_count, 1);
        const bool taken = Tell(m_program.param_id, place);
        g_choosing = false;
        return taken;
    }

    bool SaveTo(Stream& stream) override {
        stream.table = &g_stream;
        return m_component->get_state(m_component.Get(), reinterpret_cast<v3_bstream**>(&stream)) == V3_OK;
    }
    bool Load(Stream stream) override {
        stream.table = &g_stream;
        return m_component->set_state(m_component.Get(), reinterpret_cast<v3_bstream**>(&stream)) == V3_OK;
    }

    bool Activate(double rate, std::uint32_t maxFrames) override {
        v3_process_setup setup{V3_REALTIME, V3_SAMPLE_32, static_cast<std::int32_t>(maxFrames), rate};
        m_rate = rate;
        if (m_processor->setup_processing(m_processor.Get(), &setup) != V3_OK) return false;
        if (m_component->set_active(m_component.Get(), true) != V3_OK) return false;
        OnAudioThread([&] { m_processor->set_processing(m_processor.Get(), true); });
        return true;
    }
    void Deactivate() override {
        OnAudioThread([&] { m_processor->set_processing(m_processor.Get(), false); });
        m_component->set_active(m_component.Get(), false);
        HandOver();
    }
    // What the processor sent goes to the controller.
    void HandOver() {
        for (std::size_t i = 0; i < m_out.used; ++i)
            for (const Change& change : m_out.queues[i].points)
                Expect(Tell(change.parameter, change.value), "does not know a parameter that it sends");
        m_out.Set({});
    }
    std::uint32_t Latency() override { return m_processor->get_latency_samples(m_processor.Get()); }

    int TakeLatencyNews() override {
        HandOver();
        return std::exchange(g_restarts, 0);
    }

    // A host sends a change to both halves; the processor gets it without audio.
    void Flush(std::span<const Change> changes) override {
        for (const Change& change : changes) Tell(change.parameter, change.value);
        Instance::Flush(changes);
    }

    bool Process(const Block& block) override {
        m_in.Set(block.changes);
        std::array<v3_audio_bus_buffers, 4> in{}, out{};
        const bool audio = !block.outputs.empty();
        using Buffer = v3_audio_bus_buffers;
        Divide(inputs, block.inputs, in, &Buffer::channel_buffers_32, &Buffer::num_channels);
        Divide(outputs, block.outputs, out, &Buffer::channel_buffers_32, &Buffer::num_channels);
        v3_process_context context{};
        context.state = V3_PROCESS_CTX_PLAYING | V3_PROCESS_CTX_TEMPO_VALID;
        context.sample_rate = m_rate;
        context.bpm = tempo;
        v3_process_data data{};
        data.nframes = static_cast<std::int32_t>(block.frames);
        data.num_input_buses = audio ? static_cast<std::int32_t>(inputs.size()) : 0;
        data.num_output_buses = audio ? static_cast<std::int32_t>(outputs.size()) : 0;
        data.inputs = audio && !inputs.empty() ? in.data() : nullptr;
        data.outputs = audio ? out.data() : nullptr;
        data.input_params = reinterpret_cast<v3_param_changes**>(&m_in);
        data.output_params = reinterpret_cast<v3_param_changes**>(&m_out);
        data.ctx = &context;
        v3_result result = V3_FALSE;
        InRealTime([&] { result = m_processor->process(m_processor.Get(), &data); });
        return result == V3_OK;
    }
    void Reset() override {
        InRealTime([&] {
            m_processor->set_processing(m_processor.Get(), false);
            m_processor->set_processing(m_processor.Get(), true);
        });
    }

    std::unique_ptr<Window> MakeWindow() override { return MakeVst3Window(m_controller); }

    bool SetChannels(int channels) override {
        const v3_speaker_arrangement one = channels == 1 ? V3_SPEAKER_M : V3_SPEAKER_L | V3_SPEAKER_R;
        std::vector<v3_speaker_arrangement> in(inputs.size(), one), out(outputs.size(), one);
        if (m_processor->set_bus_arrangements(m_processor.Get(), in.data(),
                                              static_cast<std::int32_t>(in.size()), out.data(),
                                              static_cast<std::int32_t>(out.size())) != V3_OK)
            return false;
        v3_speaker_arrangement now = 0;
        m_processor->get_bus_arrangement(m_processor.Get(), V3_OUTPUT, 0, &now);
        Expect(now == one, "accepts a layout that it does not have afterwards");
        ReadPorts();
        return true;
    }

    void CheckFormat() override {
        v3_param_info info{};
        const auto count = m_controller->get_parameter_count(m_controller.Get());
        Expect(m_controller->get_parameter_info(m_controller.Get(), count, &info) != V3_OK,
               "describes a parameter that it does not have");
        v3_speaker_arrangement odd = V3_SPEAKER_LFE;
        Expect(m_processor->set_bus_arrangements(m_processor.Get(), &odd, 1, &odd, 1) != V3_OK ||
                   outputs.size() != 1,
               "accepts a layout of one bass channel");
        for (const Parameter& p : parameters)
            for (const double value : {0.0, 0.25, p.initial, 1.0}) {
                const double plain =
                    m_controller->normalised_parameter_to_plain(m_controller.Get(), p.id, value);
                const double back =
                    m_controller->plain_parameter_to_normalised(m_controller.Get(), p.id, plain);
                Expect(p.steps || p.hidden || std::abs(back - value) < 1e-4,
                       p.name + ": " + std::to_string(value) + " is " + std::to_string(back) +
                           " after the way through plain values");
            }
    }

private:
    bool Tell(v3_param_id id, double value) {
        return m_controller->set_parameter_normalised(m_controller.Get(), id, value) == V3_OK;
    }
    static v3_component** Create(v3_plugin_factory** factory, const v3_tuid id) {
        void* made = nullptr;
        if (v3_cpp_obj(factory)->create_instance(factory, id, v3_component_iid, &made) != V3_OK)
            throw std::runtime_error("cannot be created");
        return static_cast<v3_component**>(made);
    }
    void ReadPrograms() {
        const Held<v3_unit_information> units(m_controller, v3_unit_information_iid);
        v3_program_list_info list{};
        if (units && units->get_program_list_info(units.Get(), 0, &list) != V3_OK) list = {};
        for (std::int32_t program = 0; program < list.programCount; ++program) {
            v3_str_128 name{};
            units->get_program_name(units.Get(), list.id, program, name);
            presets.push_back(Narrow(name));
        }
        const bool chosen = (m_program.flags & V3_PARAM_PROGRAM_CHANGE) != 0;
        Expect(list.programCount == (chosen ? m_program.step_count + 1 : 0),
               "has other programs than its program parameter");
    }

    void ReadParameters() {
        for (std::int32_t i = 0; i < m_controller->get_parameter_count(m_controller.Get()); ++i) {
            v3_param_info info{};
            Expect(m_controller->get_parameter_info(m_controller.Get(), i, &info) == V3_OK,
                   "get_parameter_info fails");
            if ((info.flags & V3_PARAM_PROGRAM_CHANGE) != 0) m_program = info;
            const auto has = [&](int flag) { return (info.flags & flag) != 0; };
            parameters.push_back({info.param_id, Narrow(info.title), 0, 1, info.default_normalised_value,
                                  info.step_count, has(V3_PARAM_READ_ONLY), has(V3_PARAM_CAN_AUTOMATE),
                                  has(V3_PARAM_IS_BYPASS), has(V3_PARAM_IS_HIDDEN)});
        }
    }
    void ReadPorts() {
        for (const bool input : {true, false}) {
            std::vector<Port>& ports = input ? inputs : outputs;
            ports.clear();
            const std::int32_t direction = input ? V3_INPUT : V3_OUTPUT;
            const std::int32_t count = m_component->get_bus_count(m_component.Get(), V3_AUDIO, direction);
            v3_bus_info info{};
            for (std::int32_t i = 0; i < count; ++i) {
                Expect(m_component->get_bus_info(m_component.Get(), V3_AUDIO, direction, i, &info) == V3_OK,
                       "get_bus_info fails");
                ports.push_back({Narrow(info.bus_name), info.channel_count, info.bus_type == V3_MAIN});
                m_component->activate_bus(m_component.Get(), V3_AUDIO, direction, i, true);
            }
            Expect(m_component->get_bus_info(m_component.Get(), V3_AUDIO, direction, count, &info) != V3_OK,
                   "describes one bus more than it counts");
        }
    }
    const Held<v3_component> m_component;
    const Held<v3_audio_processor> m_processor{m_component, v3_audio_processor_iid};
    const Held<v3_edit_controller> m_controller{m_component, v3_edit_controller_iid};
    v3_param_info m_program{};
    Changes m_in{&g_changes, {}}, m_out{&g_changes, {}};
    double m_rate = 48000;
};

class Vst3File : public PluginFile {
public:
    explicit Vst3File(const std::filesystem::path& file) : m_module(Binary(file)) {
#ifdef _WIN32
        if (auto* init = m_module.Find<bool()>("InitDll")) init();
#else
        auto* entry = m_module.Find<bool(void*)>("ModuleEntry");
        if (!entry || !m_module.Find<bool()>("ModuleExit"))
            throw std::runtime_error("has no ModuleEntry, ModuleExit");
        entry(nullptr);
#endif
        auto* get = m_module.Find<v3_plugin_factory**()>("GetPluginFactory");
        m_factory = get ? get() : nullptr;
        if (!m_factory) throw std::runtime_error("has no factory");
        v3_factory_info info{};
        v3_cpp_obj(m_factory)->get_factory_info(m_factory, &info);
        Expect(*info.vendor, "its factory has no vendor");
        ReadClasses();
    }
    ~Vst3File() override {
        v3_cpp_obj_unref(m_factory);
#ifdef _WIN32
        const char* exit = "ExitDll";
#else
        const char* exit = "ModuleExit";
#endif
        if (auto* leave = m_module.Find<bool()>(exit)) leave();
    }

    std::size_t Count() const override { return m_effects.size(); }
    std::string Name(std::size_t index) const override { return m_effects[index].name; }
    std::vector<std::string> Texts(std::size_t index) const override { return m_texts[index]; }
    std::unique_ptr<Instance> Create(std::size_t index) override {
        return std::make_unique<Vst3Instance>(m_factory, m_effects[index].class_id);
    }

private:
    // The library inside of a bundle, or the file itself.
    static std::filesystem::path Binary(const std::filesystem::path& file) {
        if (!std::filesystem::is_directory(file)) return file;
#ifdef _WIN32
        return file / "Contents/x86_64-win" / file.filename();
#else
        return file / "Contents/x86_64-linux" / file.stem().concat(".so");
#endif
    }

    void ReadClasses() {
        v3_plugin_factory_2** factory2 = nullptr;
        v3_cpp_obj_query_interface(m_factory, v3_plugin_factory_2_iid, &factory2);
        const std::int32_t count = v3_cpp_obj(m_factory)->num_classes(m_factory);
        for (std::int32_t i = 0; i < count; ++i) {
            v3_class_info info{};
            Expect(v3_cpp_obj(m_factory)->get_class_info(m_factory, i, &info) == V3_OK,
                   "get_class_info fails");
            if (std::strcmp(info.category, "Audio Module Class") != 0) continue;
            m_effects.push_back(info);
            v3_class_info_2 more{};
            Expect(factory2 && v3_cpp_obj(factory2)->get_class_info_2(factory2, i, &more) == V3_OK &&
                       std::strcmp(more.name, info.name) == 0 &&
                       std::string(more.sub_categories).rfind("Fx", 0) == 0,
                   "has no description of the second kind, or another one");
            m_texts.push_back({info.name, more.version, more.vendor, more.sdk_version});
        }
        if (factory2) v3_cpp_obj_unref(factory2);
        if (m_effects.empty()) throw std::runtime_error("has no effect");
        v3_class_info info{};
        Expect(v3_cpp_obj(m_factory)->get_class_info(m_factory, count, &info) != V3_OK,
               "describes one class more than it has");
        void* object = nullptr;
        const v3_tuid unknown{1, 2, 3};
        Expect(v3_cpp_obj(m_factory)->create_instance(m_factory, unknown, v3_component_iid, &object) != V3_OK,
               "creates a plug-in of an unknown id");
    }

    Module m_module;
    v3_plugin_factory** m_factory;
    std::vector<v3_class_info> m_effects;
    std::vector<std::vector<std::string>> m_texts;
};

}  // namespace

std::unique_ptr<PluginFile> OpenVst3(const std::filesystem::path& file) {
    return std::make_unique<Vst3File>(file);
}

}  // namespace PluginHost
