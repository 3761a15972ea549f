#pragma once

#if DSP_HAVE_LIBAVFILTER

#include <benchmark/benchmark.h>

#include <cstring>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

extern "C" {
#include <libavfilter/avfilter.h>
#include <libavfilter/buffersink.h>
#include <libavfilter/buffersrc.h>
#include <libavutil/channel_layout.h>
#include <libavutil/frame.h>
#include <libavutil/opt.h>
}

#include "Support/Signals.h"

// A chain of libavfilter's audio filters as a peer in the benchmarks. `format` is the sample format that
// the filters work in themselves ("flt", "fltp", "dblp" ...), so that no conversion is timed. The chain gets
// every block as a new frame of its own, as a decoder hands them out: filters that work in place can. What
// the frames and the graph cost by themselves is measured with the chain "anull".
class FfmpegPeer {
public:
    FfmpegPeer(const std::string& filters, const std::string& format, int rate, int frames)
        : m_rate(rate), m_frames(frames) {
        av_log_set_level(AV_LOG_ERROR);
        m_format = av_get_sample_fmt(format.c_str());
        const std::string source = "sample_fmt=" + format + ":sample_rate=" + std::to_string(rate) +
                                   ":channel_layout=stereo:time_base=1/" + std::to_string(rate);
        m_graph.reset(avfilter_graph_alloc());
        m_graph->nb_threads = 1;
        Check(avfilter_graph_create_filter(&m_source, avfilter_get_by_name("abuffer"), "in", source.c_str(),
                                           nullptr, m_graph.get()));
        Check(avfilter_graph_create_filter(&m_sink, avfilter_get_by_name("abuffersink"), "out", nullptr,
                                           nullptr, m_graph.get()));
        AVFilterInOut* outputs = avfilter_inout_alloc();
        AVFilterInOut* inputs = avfilter_inout_alloc();
        *outputs = {av_strdup("in"), m_source, 0, nullptr};
        *inputs = {av_strdup("out"), m_sink, 0, nullptr};
        const std::string chain = filters + ",aformat=sample_fmts=" + format;
        Check(avfilter_graph_parse_ptr(m_graph.get(), chain.c_str(), &inputs, &outputs, nullptr));
        avfilter_inout_free(&inputs);
        avfilter_inout_free(&outputs);
        Check(avfilter_graph_config(m_graph.get(), nullptr));

        m_input.reset(av_frame_alloc());
        m_output.reset(av_frame_alloc());
    }

    // Runs one block of stereo frames: interleaved samples of the format's type.
    template <typename Sample>
    void Run(const Sample* interleaved) {
        m_input->format = m_format;
        m_input->sample_rate = m_rate;
        m_input->nb_samples = m_frames;
        av_channel_layout_default(&m_input->ch_layout, 2);
        Check(av_frame_get_buffer(m_input.get(), 0));
        if (av_sample_fmt_is_planar(m_format))
            for (int channel = 0; channel < 2; ++channel) {
                auto* plane = reinterpret_cast<Sample*>(m_input->data[channel]);
                for (int i = 0; i < m_frames; ++i) plane[i] = interleaved[2 * i + channel];
            }
        else
            std::memcpy(m_input->data[0], interleaved,
                        2 * sizeof(Sample) * static_cast<std::size_t>(m_frames));
        m_input->pts = m_pts;
        m_pts += m_frames;
        Check(av_buffersrc_add_frame(m_source, m_input.get()));  // which leaves it empty
        while (av_buffersink_get_frame(m_sink, m_output.get()) >= 0) av_frame_unref(m_output.get());
    }

private:
    struct Free {
        void operator()(AVFilterGraph* graph) const { avfilter_graph_free(&graph); }
        void operator()(AVFrame* frame) const { av_frame_free(&frame); }
    };
    static void Check(int result) {
        if (result < 0) throw std::runtime_error("libavfilter refused the chain");
    }

    int m_rate, m_frames;
    std::int64_t m_pts = 0;
    AVSampleFormat m_format;
    std::unique_ptr<AVFilterGraph, Free> m_graph;
    std::unique_ptr<AVFrame, Free> m_input, m_output;
    AVFilterContext *m_source = nullptr, *m_sink = nullptr;
};

// Times a chain over blocks of state.range(0) stereo frames of noise.
template <typename Sample>
void RunFfmpeg(benchmark::State& state, const std::string& filters, const std::string& format) {
    const auto frames = static_cast<std::size_t>(state.range(0));
    FfmpegPeer peer(filters, format, 48000, static_cast<int>(frames));
    const auto input = TestSupport::Noise<Sample>(2 * frames);
    for (auto _ : state) peer.Run(input.data());
    state.SetItemsProcessed(state.iterations() * state.range(0));
}

#endif
