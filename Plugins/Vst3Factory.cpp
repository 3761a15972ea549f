#include <travesty/factory.h>

#include <exception>
#include <string>

#include "Vst3Plugin.h"
#include "Vst3Text.h"

// Every plug-in as VST3: a class for each.
namespace {

using namespace Corvo::Plugins;

constexpr char kVendor[] = "DSPDll", kVersion[] = DSP_PLUGIN_VERSION, kSdk[] = "VST 3.7";
constexpr char kCategory[] = "Audio Module Class";
constexpr std::int32_t kAnyNumber = 0x7fffffff, kUnicode = 0x10;

class Factory {
public:
    v3_result Query(const std::uint8_t* id, void** object) {
        *object = nullptr;
        for (const auto& known :
             {&v3_funknown_iid, &v3_plugin_factory_iid, &v3_plugin_factory_2_iid, &v3_plugin_factory_3_iid})
            if (v3_tuid_match(*known, id)) *object = &m_face;
        return *object ? V3_OK : V3_NO_INTERFACE;
    }
    // It lives as long as the file is loaded.
    std::uint32_t Count() { return 1; }

    v3_result Info(v3_factory_info* info) {
        *info = {};
        CopyText(info->vendor, kVendor);
        info->flags = kUnicode;
        return V3_OK;
    }
    std::int32_t Classes() { return static_cast<std::int32_t>(PluginRows().size()); }

    v3_result ClassInfo(std::int32_t index, v3_class_info* info) { return Describe(index, *info); }
    v3_result ClassInfo2(std::int32_t index, v3_class_info_2* info) { return DescribeFully(index, *info); }
    v3_result ClassInfo3(std::int32_t index, v3_class_info_3* info) { return DescribeFully(index, *info); }
    v3_result SetContext(v3_funknown**) { return V3_NOT_IMPLEMENTED; }

    v3_result Create(const std::uint8_t* classId, const std::uint8_t* id, void** object) {
        *object = nullptr;
        for (const PluginRow& row : PluginRows()) {
            v3_tuid own;
            WriteId(row, own);
            if (!v3_tuid_match(own, classId)) continue;
            auto* const plugin = new Vst3Plugin(row);
            const v3_result result = plugin->Query(id, object);
            plugin->Unref();
            return result;
        }
        return V3_NO_INTERFACE;
    }

    void* Face() { return &m_face; }

private:
    static void WriteId(const PluginRow& row, v3_tuid& id) {
        const auto word = [](const char* letters) {
            std::uint32_t value = 0;
            for (int i = 0; i < 4; ++i) value = value << 8 | static_cast<std::uint8_t>(letters[i]);
            return value;
        };
        const v3_tuid made = V3_ID(word("DSPD"), word("llVS"), word("T3fx"), word(row.code));
        std::copy_n(made, sizeof made, id);
    }
    template <typename Kind>
    v3_result Describe(std::int32_t index, Kind& info) {
        info = {};
        if (index < 0 || index >= Classes()) return V3_INVALID_ARG;
        const PluginRow& row = PluginRows()[static_cast<std::size_t>(index)];
        WriteId(row, info.class_id);
        info.cardinality = kAnyNumber;
        CopyText(info.category, kCategory);
        CopyText(info.name, row.name);
        return V3_OK;
    }
    template <typename Kind>
    v3_result DescribeFully(std::int32_t index, Kind& info) {
        if (Describe(index, info) != V3_OK) return V3_INVALID_ARG;
        const PluginRow& row = PluginRows()[static_cast<std::size_t>(index)];
        CopyText(info.sub_categories, std::string("Fx|") + row.vst3Category);
        CopyText(info.vendor, kVendor);
        CopyText(info.version, kVersion);
        CopyText(info.sdk_version, kSdk);
        return V3_OK;
    }

    static constexpr auto MakeTable() {
        using F = Factory;
        return v3_plugin_factory_cpp{{kVst3Entry<&F::Query>, kVst3Entry<&F::Count>, kVst3Entry<&F::Count>},
                                     {kVst3Entry<&F::Info>, kVst3Entry<&F::Classes>,
                                      kVst3Entry<&F::ClassInfo>, kVst3Entry<&F::Create>},
                                     {kVst3Entry<&F::ClassInfo2>},
                                     {kVst3Entry<&F::ClassInfo3>, kVst3Entry<&F::SetContext>}};
    }
    static const v3_plugin_factory_cpp kTable;

    Vst3Face<Factory> m_face{&kTable, this};
};
const v3_plugin_factory_cpp Factory::kTable = MakeTable();

}  // namespace

extern "C" {
__attribute__((visibility("default"))) void* GetPluginFactory() {
    static Factory factory;
    return factory.Face();
}
#ifdef _WIN32
__attribute__((visibility("default"))) bool InitDll() { return true; }
__attribute__((visibility("default"))) bool ExitDll() { return true; }
#else
__attribute__((visibility("default"))) bool ModuleEntry(void*) { return true; }
__attribute__((visibility("default"))) bool ModuleExit() { return true; }
#endif
}
