// Life and parameters: what a host learns of a plug-in before it sounds.
#include <cmath>
#include <set>

#include "Checks.h"

namespace PluginHost {

void CheckLife(PluginFile& file, std::size_t index) {
    auto one = file.Create(index), other = file.Create(index);
    for (Instance* plugin : {one.get(), other.get()})
        Expect(plugin->Activate(48000, 256), "two instances cannot both be activated");
    one->Deactivate();
    one.reset();
    Expect(IsFinite(Render(*other, Noise(*other, 256))), "suffers from another instance's end");
    other->Deactivate();
    other->CheckFormat();
    Parameter unknown{};
    unknown.id = 0x7fffffff;
    Expect(!other->Text(unknown, 0) && !other->Value(unknown, "1"), "has texts for an unknown parameter");
    other->Flush(std::vector<Change>{{unknown.id, 0.5, 0}});
    for (const std::string& text : file.Texts(index)) Expect(!text.empty(), "has no name, version or vendor");
    const auto audible = file.Create(index);
    for (const auto* ports : {&audible->inputs, &audible->outputs}) {
        Expect(!ports->empty(), "has no input or no output");
        for (const Port& port : *ports)
            Expect(!port.name.empty() && port.channels > 0 && port.main == (&port == &ports->front()),
                   "has a port without name, or another main one than the first");
    }
}

namespace {

void CheckTexts(Instance& plugin, const Parameter& parameter) {
    std::set<std::string> texts;
    const int last = parameter.steps > 0 ? std::min(parameter.steps, 64) : 16;
    for (int i = 0; i <= last; ++i) {
        const double value = parameter.At(static_cast<double>(i) / last);
        const std::string place = parameter.name + " at " + std::to_string(value);
        const std::string text = plugin.Text(parameter, value).value_or("");
        const double back = plugin.Value(parameter, text).value_or(NAN);
        const std::string again = plugin.Text(parameter, back).value_or("");
        texts.insert(text);
        Expect(!text.empty() && back >= parameter.minimum && back <= parameter.maximum && again == text,
               place + ": its text \"" + text + "\" comes back as " + std::to_string(back) + ", \"" + again +
                   "\"");
    }
    Expect(parameter.steps == 0 || parameter.steps > 64 || texts.size() == static_cast<std::size_t>(last) + 1,
           parameter.name + ": two of its steps have one text");
}

}  // namespace

void CheckParameters(PluginFile& file, std::size_t index) {
    const auto plugin = file.Create(index);
    std::set<std::uint32_t> ids;
    std::set<std::string> names;
    int bypasses = 0;
    for (const Parameter& p : plugin->parameters) {
        if (p.hidden) continue;
        Expect(ids.insert(p.id).second, p.name + ": another parameter has its id");
        Expect(names.insert(p.name).second, p.name + ": another parameter has its name");
        Expect(!p.name.empty(), "a parameter has no name");
        Expect(p.minimum < p.maximum && p.minimum <= p.initial && p.initial <= p.maximum,
               p.name + ": its default lies outside of its range");
        Expect(p.steps >= 0, p.name + ": fewer than one step");
        Expect(!p.readOnly || !p.automatable, p.name + ": read-only, and yet automatable");
        if (p.readOnly) continue;
        Expect(std::abs(plugin->Get(p) - p.initial) <= 1e-6 * (p.maximum - p.minimum),
               p.name + ": begins with " + std::to_string(plugin->Get(p)) + ", not its default");
        if (plugin->HasTexts()) CheckTexts(*plugin, p);
        if (p.bypass)
            Expect(++bypasses == 1 && p.steps == 1, "has a second bypass, or one that is no switch");
    }
    Expect(bypasses == 1, "has no bypass");
}

}  // namespace PluginHost
