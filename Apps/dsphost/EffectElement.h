#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "ChainElement.h"
#include "EffectParameters.h"
#include "EffectTable.h"

namespace dsphost {

// An effect of the library in the chain.
//
// Its settings are "label=value, label=value, ...", applied in order; "preset=NAME" or "chunk=FILE" give the
// state to start from instead of the default preset, wherever they stand.
class EffectElement : public ChainElement {
public:
    // `kind` lives as long as the element.
    EffectElement(const EffectKind& kind, std::string_view settings);
    ~EffectElement() override;

    std::string Name() const override { return m_name; }
    bool Prepare(int maxFrames, const tWAVEFORMATEX& format, bool planar) override;
    int Latency() override;
    void Process(double* samples, int frames, std::int64_t time) override;
    double LongestGap() override;
    std::vector<int> AutomationLanes(std::string_view parameter) override;
    void Automate(int lane, std::span<const AutomationPoint> points) override;
    std::string SourceFile() const override { return m_source; }
    std::vector<std::uint8_t> State() override;

private:
    void ChoosePreset(std::string_view name);
    void LoadChunk(const std::string& path);
    void SetParameter(std::string_view label, std::string_view text);
    void PlayDue(std::int64_t time);

    struct Lane {
        int index;
        std::vector<AutomationPoint> points;
        std::size_t next = 0;  // the first that is not due
    };

    const EffectKind& m_kind;
    std::unique_ptr<Effect> m_effect;
    std::string m_name, m_source;
    std::vector<EffectParameter> m_parameters;
    tWAVEFORMATEX m_format{};
    std::vector<Lane> m_lanes;
    bool m_planar = false;
    std::vector<double> m_planes;  // one channel behind the other; floats where the format says so
};

}  // namespace dsphost
