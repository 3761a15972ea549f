#pragma once

#include <travesty/audio_processor.h>
#include <travesty/component.h>
#include <travesty/edit_controller.h>
#include <travesty/unit.h>

#include <atomic>
#include <cstdint>
#include <vector>

#include "Vst3Object.h"
#include "Vst3Parameters.h"

namespace Corvo::Plugins {

// A plug-in as VST3: component, processor, controller and units in one object, made for stereo; a host may
// ask for mono instead. The controls are those of stereo always.
class Vst3Plugin {
public:
    explicit Vst3Plugin(const PluginRow& row);  // with one reference; throws std::bad_alloc

    v3_result Query(const std::uint8_t* id, void** object);
    std::uint32_t Ref();
    std::uint32_t Unref();  // the last one deletes it

private:
    ~Vst3Plugin();
    struct Tables;
    using Face = Vst3Face<Vst3Plugin>;

    // One parameter's changes within a block.
    struct Queue {
        v3_param_value_queue** queue;
        v3_param_id id;
        std::int32_t next, count, frame;
        double value;
        void Advance();
    };
    struct Channels {
        const float *in[2]{}, *side[2]{};
        float* out[2]{};
    };

    // Component.
    v3_result Initialize(v3_funknown** context);
    v3_result Terminate();
    v3_result ControllerClass(std::uint8_t* id);
    v3_result IoMode(std::int32_t mode);
    std::int32_t BusCount(std::int32_t media, std::int32_t direction);
    v3_result BusInfo(std::int32_t media, std::int32_t direction, std::int32_t bus, v3_bus_info* info);
    v3_result Routing(v3_routing_info* in, v3_routing_info* out);
    v3_result ActivateBus(std::int32_t media, std::int32_t direction, std::int32_t bus, v3_bool on);
    v3_result SetActive(v3_bool on);
    v3_result SetState(v3_bstream** stream);
    v3_result GetState(v3_bstream** stream);

    // Processor.
    v3_result SetArrangements(v3_speaker_arrangement* in, std::int32_t ins, v3_speaker_arrangement* out,
                              std::int32_t outs);
    v3_result Arrangement(std::int32_t direction, std::int32_t bus, v3_speaker_arrangement* arrangement);
    v3_result CanProcess(std::int32_t sampleSize);
    std::uint32_t Latency();
    v3_result Setup(v3_process_setup* setup);
    v3_result SetProcessing(v3_bool on);
    v3_result Process(v3_process_data* block);
    std::uint32_t Tail();
    std::uint32_t Requirements();

    // Controller.
    v3_result TakeComponentState(v3_bstream** stream);
    v3_result NoState(v3_bstream** stream);
    std::int32_t ParameterCount();
    v3_result ParameterInfo(std::int32_t index, v3_param_info* info);
    v3_result TextOf(v3_param_id id, double normalised, std::int16_t* text);
    v3_result ValueOf(v3_param_id id, std::int16_t* text, double* normalised);
    double ToPlain(v3_param_id id, double normalised);
    double ToNormalised(v3_param_id id, double plain);
    double Value(v3_param_id id);
    v3_result SetValue(v3_param_id id, double normalised);
    v3_result SetHandler(v3_component_handler** handler);
    v3_plugin_view** CreateView(const char* name);

    // Units: a group is one, below the root, which has the programs.
    std::int32_t UnitCount();
    v3_result UnitInfo(std::int32_t index, v3_unit_info* info);
    std::int32_t ProgramListCount();
    v3_result ProgramListInfo(std::int32_t index, v3_program_list_info* info);
    v3_result ProgramName(std::int32_t list, std::int32_t program, std::int16_t* name);
    v3_result ProgramInfo(std::int32_t list, std::int32_t program, const char* attribute,
                          std::int16_t* value);
    v3_result HasPitchNames(std::int32_t list, std::int32_t program);
    v3_result PitchName(std::int32_t list, std::int32_t program, std::int16_t pitch, std::int16_t* name);
    std::int32_t SelectedUnit();
    v3_result SelectUnit(std::int32_t unit);
    v3_result UnitByBus(std::int32_t media, std::int32_t direction, std::int32_t bus, std::int32_t channel,
                        std::int32_t* unit);
    v3_result SetProgramData(std::int32_t list, std::int32_t program, v3_bstream** data);

    const std::vector<std::string>& Groups() const;
    bool HasBus(std::int32_t media, std::int32_t direction, std::int32_t bus);
    int ProgramNow() const;
    void ShowValues();
    void Restart(std::int32_t flags);
    void TellLatency();
    void TakeTempo(const v3_process_context* context);
    void FindQueues(v3_param_changes** changes);
    std::int32_t TakeChanges(std::int32_t frame);
    void TakeChange(v3_param_id id, double normalised);
    bool FindChannels(const v3_process_data& block, Channels& channels) const;
    void Send(v3_param_changes** changes);
    static bool SendValue(v3_param_changes** changes, v3_param_id id, double normalised);

    Face m_component, m_processor, m_controller, m_units, m_requirements;
    std::atomic<std::uint32_t> m_references{1};
    const std::unique_ptr<Core> m_core;
    const Vst3Parameters m_parameters;
    const bool m_hasOutputs;
    std::vector<std::atomic<double>> m_values;  // what the host knows, normalised, in the parameters' order
    v3_component_handler** m_handler = nullptr;
    std::vector<Queue> m_queues;  // of the block at hand; never grows while processing
    double m_rate = 48000.0;
    int m_longest = 1024;
    bool m_active = false, m_ran = false;
    int m_sideChannels;  // that the host gives, 0 to 2
    std::atomic<bool> m_sideIsOn{false};
    std::atomic<bool> m_sendAll{false};  // values, with the next block
    std::atomic<int> m_toldLatency{0};
    int m_sentLatency = 0;
};

}  // namespace Corvo::Plugins
