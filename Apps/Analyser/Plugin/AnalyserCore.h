#pragma once

#include <vector>

#include "Core.h"
#include "Processor.h"

namespace analyser {

// The analyser behind all that plug-in formats want of it: the tuner's readings as outputs, what is chosen in
// the menu as its state, and the window.
class AnalyserCore final : public Corvo::Plugins::Core {
public:
    AnalyserCore(const Corvo::Plugins::PluginRow& row, int channels);

    void Prepare(double rate, int frames) override;
    float Value(int port) const override;
    void Run(const float* const* in, float* const* out, const float* const* side, int frames) override;
    std::vector<std::uint8_t> State() override;
    bool TakeState(const std::vector<std::uint8_t>& bytes) override;
    bool HasWindow() const override { return true; }
    std::unique_ptr<Corvo::Plugins::Window> MakeWindow() override;

private:
    mutable Processor m_processor;
};

}  // namespace analyser
