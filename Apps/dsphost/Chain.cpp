#include "Chain.h"

#include <algorithm>
#include <utility>

#include "EffectTable.h"
#include "Errors.h"
#include "Text.h"

namespace dsphost {
namespace {

std::vector<std::unique_ptr<ChainElement>> MakeElements(std::span<const std::string> texts) {
    std::vector<std::string> names;
    for (const auto& kind : ElementKinds()) names.push_back(kind.name);
    std::vector<std::unique_ptr<ChainElement>> elements;
    for (const std::string_view text : texts) {
        const std::size_t colon = std::min(text.find(':'), text.size());
        const auto& kind = ElementKinds()[FindName(text.substr(0, colon), names, "effect")];
        elements.push_back(kind.make(Trimmed(text.substr(std::min(colon + 1, text.size())))));
    }
    return elements;
}

}  // namespace

std::vector<int> ChainElement::AutomationLanes(std::string_view) {
    throw UserError(Name() + " plays no automation");
}
void ChainElement::Automate(int, std::span<const AutomationPoint>) {}
std::vector<std::uint8_t> ChainElement::State() { throw UserError(Name() + " has no settings chunk"); }

Chain::Chain(std::vector<std::unique_ptr<ChainElement>> elements)
    : m_elements(std::move(elements)), m_points(m_elements.size()) {}

Chain::Chain(std::span<const std::string> texts) : Chain(MakeElements(texts)) {}

void Chain::Automate(std::size_t element, int lane, std::span<const AutomationPoint> points) {
    m_elements[element]->Automate(lane, points);
    for (const auto& point : points) m_points[element].push_back(point.frame);
}

std::vector<std::string> Chain::Prepare(int maxFrames, const tWAVEFORMATEX& format, bool planar) {
    std::vector<std::string> interleavedOnly;
    m_delays.clear();
    m_cuts.clear();
    m_latency = 0;
    for (std::size_t i = 0; i < m_elements.size(); ++i) {
        if (!m_elements[i]->Prepare(maxFrames, format, planar) && planar)
            interleavedOnly.push_back(m_elements[i]->Name());
        m_delays.push_back(m_latency);
        for (const std::int64_t point : m_points[i]) m_cuts.push_back(point + m_latency);
        m_latency += m_elements[i]->Latency();
    }
    std::ranges::sort(m_cuts);
    return interleavedOnly;
}

double Chain::LongestGap() {
    double gap = 0.0;
    for (const auto& element : m_elements) gap += element->LongestGap();
    return gap;
}

int Chain::FramesToCut(std::int64_t position, int most) const {
    const auto next = std::ranges::upper_bound(m_cuts, position);
    return next == m_cuts.end() ? most : static_cast<int>(std::min<std::int64_t>(most, *next - position));
}

void Chain::Process(double* samples, int frames, std::int64_t position) {
    for (std::size_t i = 0; i < m_elements.size(); ++i)
        m_elements[i]->Process(samples, frames, position - m_delays[i]);
}

}  // namespace dsphost
