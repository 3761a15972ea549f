#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

#include "Vst3Plugin.h"

// What a VST3 plug-in does with sound, and with what comes along with it.
namespace Corvo::Plugins {
namespace {

constexpr std::int32_t kNever = std::numeric_limits<std::int32_t>::max();
constexpr std::uint32_t kEndlessTail = 0xffffffff;

}  // namespace

v3_result Vst3Plugin::CanProcess(std::int32_t sampleSize) {
    return sampleSize == V3_SAMPLE_32 ? V3_OK : V3_FALSE;
}

v3_result Vst3Plugin::Setup(v3_process_setup* setup) {
    if (m_active || CanProcess(setup->symbolic_sample_size) != V3_OK) return V3_FALSE;
    if (!(setup->sample_rate > 0.0 && std::isfinite(setup->sample_rate)) || setup->max_block_size < 0)
        return V3_INVALID_ARG;
    m_rate = setup->sample_rate;
    m_longest = setup->max_block_size;
    return V3_OK;
}

v3_result Vst3Plugin::SetActive(v3_bool on) {
    m_active = on != 0;
    if (m_active) m_core->Prepare(m_rate, m_longest);
    m_ran = false;
    return V3_OK;
}

v3_result Vst3Plugin::SetProcessing(v3_bool on) {
    if (on && m_active && std::exchange(m_ran, false)) m_core->Reset();
    return V3_OK;
}

std::uint32_t Vst3Plugin::Latency() {
    m_toldLatency = m_core->Latency();
    return static_cast<std::uint32_t>(m_toldLatency.load());
}

std::uint32_t Vst3Plugin::Tail() {
    return m_core->Row().Is(kRings) ? kEndlessTail : static_cast<std::uint32_t>(m_core->Latency());
}

std::uint32_t Vst3Plugin::Requirements() {
    return m_core->Row().Is(kTempo) ? V3_PROCESS_CTX_NEED_TEMPO | V3_PROCESS_CTX_NEED_TIME_SIG : 0;
}

v3_result Vst3Plugin::Process(v3_process_data* block) {
    if (!m_active) return V3_NOT_INITIALIZED;
    if (block->symbolic_sample_size != V3_SAMPLE_32 || block->nframes < 0) return V3_INVALID_ARG;
    TakeTempo(block->ctx);
    FindQueues(block->input_params);
    // Without outputs only values are handed over.
    const std::int32_t frames = block->num_output_buses > 0 ? block->nframes : 0;
    Channels channels;
    if (frames > 0 && !FindChannels(*block, channels)) return V3_INVALID_ARG;
    for (std::int32_t done = 0;;) {
        const std::int32_t until = std::min(TakeChanges(done), frames);
        const auto piece = [done](auto& from) {
            auto pointers = std::to_array(from);
            for (auto& pointer : pointers) pointer += pointer ? done : 0;
            return pointers;
        };
        m_core->Run(piece(channels.in).data(), piece(channels.out).data(), piece(channels.side).data(),
                    until - done);
        done = until;
        if (done >= frames) break;
    }
    TakeChanges(kNever - 1);
    m_ran = m_ran || frames > 0;
    if (frames > 0) block->outputs[0].channel_silence_bitset = 0;
    Send(block->output_params);
    return V3_OK;
}

void Vst3Plugin::TakeTempo(const v3_process_context* context) {
    if (!context || (context->state & V3_PROCESS_CTX_TEMPO_VALID) == 0) return;
    const bool hasMeter = (context->state & V3_PROCESS_CTX_TIME_SIG_VALID) != 0;
    m_core->Tempo(context->bpm, hasMeter ? context->time_sig_numerator : 4,
                  hasMeter ? context->time_sig_denom : 4);
}

// The channels of the block; those that come without an input get silence. False without outputs.
bool Vst3Plugin::FindChannels(const v3_process_data& block, Channels& channels) const {
    const auto buffer = [](v3_audio_bus_buffers* buses, int count, int bus, int channel) -> float* {
        if (bus >= count || !buses || channel >= buses[bus].num_channels || !buses[bus].channel_buffers_32)
            return nullptr;
        return buses[bus].channel_buffers_32[channel];
    };
    for (int c = 0; c < m_core->Channels(); ++c) {
        channels.in[c] = buffer(block.inputs, block.num_input_buses, 0, c);
        channels.out[c] = buffer(block.outputs, block.num_output_buses, 0, c);
        if (!channels.out[c]) return false;
        if (m_sideIsOn) channels.side[c] = buffer(block.inputs, block.num_input_buses, 1, c);
    }
    for (int c = 0; c < m_core->Channels(); ++c)
        if (!channels.in[c]) {
            std::fill_n(channels.out[c], block.nframes, 0.0f);
            channels.in[c] = channels.out[c];
        }
    return true;
}

void Vst3Plugin::Queue::Advance() {
    frame = kNever;
    if (next < count && v3_cpp_obj(queue)->get_point(queue, next++, &frame, &value) != V3_OK) frame = kNever;
}

void Vst3Plugin::FindQueues(v3_param_changes** changes) {
    m_queues.clear();
    const std::int32_t count = changes ? v3_cpp_obj(changes)->get_param_count(changes) : 0;
    for (std::int32_t i = 0; i < count && m_queues.size() < m_queues.capacity(); ++i) {
        auto** const queue = v3_cpp_obj(changes)->get_param_data(changes, i);
        if (!queue) continue;
        const auto id = v3_cpp_obj(queue)->get_param_id(queue);
        const Port* const port = m_parameters.PortOf(id);
        if (id != Vst3Parameters::kBypass && (!port || port->isOutput)) continue;
        m_queues.push_back({queue, id, 0, v3_cpp_obj(queue)->get_point_count(queue), kNever, 0.0});
        m_queues.back().Advance();
    }
}

// Those up to a frame; the frame of the next one.
std::int32_t Vst3Plugin::TakeChanges(std::int32_t frame) {
    std::int32_t next = kNever;
    for (Queue& queue : m_queues) {
        for (; queue.frame <= frame; queue.Advance()) TakeChange(queue.id, queue.value);
        next = std::min(next, queue.frame);
    }
    return next;
}

void Vst3Plugin::TakeChange(v3_param_id id, double normalised) {
    if (!std::isfinite(normalised)) return;
    normalised = std::clamp(normalised, 0.0, 1.0);
    const double plain = m_parameters.Plain(id, normalised);
    if (id == Vst3Parameters::kBypass)
        m_core->Bypass(plain > 0.5);
    else
        m_core->Set(static_cast<int>(id) - 1, static_cast<float>(plain));
    m_values[id] = normalised;
}

// What became different by itself. The host hands it to the controller on its own thread.
void Vst3Plugin::Send(v3_param_changes** changes) {
    const bool all = m_sendAll.exchange(false);
    const bool others = m_core->TakeOtherValues() || all;
    if (others || m_hasOutputs)
        for (std::size_t i = 0; i < m_core->Ports().size(); ++i) {
            if (!others && !m_core->Ports()[i].isOutput) continue;
            const auto id = static_cast<v3_param_id>(i + 1);
            const auto plain = static_cast<double>(m_core->Value(static_cast<int>(i)));
            const double value = m_parameters.Normalised(id, plain);
            if (!all && std::abs(value - m_values[id]) < 1e-5) continue;
            m_values[id] = value;
            SendValue(changes, id, value);
        }
    const int latency = m_core->Latency();
    if (latency == m_toldLatency)
        m_sentLatency = latency;
    else if (latency != m_sentLatency &&
             SendValue(changes, Vst3Parameters::kLatency,
                       m_parameters.Normalised(Vst3Parameters::kLatency, latency)))
        m_sentLatency = latency;
}

// False where the host has no room for it.
bool Vst3Plugin::SendValue(v3_param_changes** changes, v3_param_id id, double normalised) {
    std::int32_t index = 0;
    auto** const queue = changes ? v3_cpp_obj(changes)->add_param_data(changes, &id, &index) : nullptr;
    return queue && v3_cpp_obj(queue)->add_point(queue, 0, normalised, &index) == V3_OK;
}

}  // namespace Corvo::Plugins
