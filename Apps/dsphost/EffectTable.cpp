#include "EffectTable.h"

#include "EffectElement.h"
#include "EqualiserElement.h"

namespace dsphost {

std::span<const std::string> EffectNames() {
    static const auto names = [] {
        std::vector<std::string> all;
        for (const auto& kind : EffectKinds()) all.emplace_back(kind.name);
        return all;
    }();
    return names;
}

std::span<const ElementKind> ElementKinds() {
    static const auto kinds = [] {
        std::vector<ElementKind> all;
        for (const auto& kind : EffectKinds())
            all.push_back({kind.name, [&kind](std::string_view settings) {
                               return std::make_unique<EffectElement>(kind, settings);
                           }});
        // What is no effect but can stand in a chain: one line each.
        all.push_back({EqualiserElement::kName, std::make_unique<EqualiserElement, std::string_view>});
        return all;
    }();
    return kinds;
}

}  // namespace dsphost
