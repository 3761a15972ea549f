#pragma once

#include <DistrhoPlugin.hpp>

#include "Processor.h"

START_NAMESPACE_DISTRHO

// The plug-in as DPF wants it. Its window reaches the processor directly.
class AnalyserPlugin final : public Plugin {
public:
    AnalyserPlugin();
    analyser::Processor& GetProcessor() { return m_processor; }

protected:
    const char* getDescription() const override;
    const char* getLabel() const override;
    const char* getMaker() const override;
    const char* getLicense() const override;
    std::uint32_t getVersion() const override;
    std::int64_t getUniqueId() const override;

    void initParameter(std::uint32_t index, Parameter& parameter) override;
    float getParameterValue(std::uint32_t index) const override;
    void setParameterValue(std::uint32_t, float) override {}  // all of them are outputs
    void initState(std::uint32_t index, State& state) override;
    String getState(const char* key) const override;
    void setState(const char* key, const char* value) override;
    void sampleRateChanged(double rate) override;
    void run(const float** inputs, float** outputs, std::uint32_t frames) override;

private:
    mutable analyser::Processor m_processor;
};

END_NAMESPACE_DISTRHO
