#pragma once

#include <memory>
#include <span>
#include <string_view>

#include "DSP/Effects/Framework/CorvoEffectBase.h"
#include "Platform/Export.h"

namespace Corvo::DSP {

// One kind of effect, for hosts that choose by name instead of including a class.
struct EffectKind {
    const char* name;                            // what GetName() of its instances says
    std::unique_ptr<CorvoEffectBase> (*make)();  // throws std::bad_alloc

    // A new instance that starts as a host shows it: from its default preset, where it has presets. The
    // caller owns it. Not on the audio thread; throws std::bad_alloc.
    DSP_API std::unique_ptr<CorvoEffectBase> MakeReady() const;
    // Another instance with the settings and the host of `effect`, which is of this kind; not
    // prepared. User-interface thread of `effect`; throws std::bad_alloc.
    DSP_API std::unique_ptr<CorvoEffectBase> Copy(CorvoEffectBase& effect) const;
};

// Every kind of this library, in the order in which a host may list them. Constant; any thread.
DSP_API std::span<const EffectKind> EffectKinds();
// By name, in letters of either case; null where there is none.
DSP_API const EffectKind* FindEffectKind(std::string_view name);

}  // namespace Corvo::DSP
