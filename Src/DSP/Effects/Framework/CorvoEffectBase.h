#pragma once

#include <atomic>
#include <concepts>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "DSP/Effects/Framework/ParameterDescription.h"
#include "DSP/Effects/Framework/ProcessFlags.h"
#include "Host/BuiltinEditor.h"
#include "Host/CorvoEffectHostCallback.h"
#include "Host/GenericUIData.h"
#include "Host/PluginGenericUILookAndFeel.h"
#include "Host/PluginParameterInfo.h"
#include "Platform/Export.h"
#include "Platform/MediaParams.h"
#include "Platform/WaveFormat.h"

namespace Corvo::DSP {

struct EffectTable;
struct ParameterRow;
struct TailRecord;

// The contract between the host and every effect.
//
// Life: construct; restore a chunk or preset if there is one; InitProcessing before the first block and
// whenever format or largest block change; Process or ProcessNoninterleaved per block; Cleanup to clear
// running state; destroy.
//
// Blocks are processed in place. Buffers are declared as double and hold what the format's
// wBitsPerSample says: doubles at 64, floats at 32 whatever the pointer's type; every effect says what it
// does with other widths. Interleaved blocks hold frames * nChannels samples, planar ones are nChannels
// buffers of `frames`.
//
// Threads: processing, envelope playback and cooking belong to the audio thread; parameter, text, preset
// and chunk calls to the user-interface thread. Edits only store a value and raise m_cook, and the next
// block re-derives. AddEnvelope is called while no block is being processed.
//
// Indices: a "real" index counts the effect's own parameters, an "external" one the host's, which may
// stand for a left/right pair. The base checks no index; an effect ignores a real index it does not have.
//
// Memory: when there is none, constructors and the user-interface thread's calls throw std::bad_alloc. A call
// that does has stored nothing or all that it was given, and may be repeated. Processing and preparation
// never throw.
//
// Cost: a block takes time in proportion to its frames, some nanoseconds each (README, "Effects"), and what
// its effect derives anew after an edit. InitProcessing makes memory, up to some megabytes. Questions about
// the effect and its values cost next to nothing; texts, lists and chunks allocate what they return.
//
// Most effects are described by a table: names, texts, choices, presets and the layout of the settings chunk.
// The operations below answer from it; an effect without one has the answers given here.
//
// The order of the virtual operations is part of the contract.
class DSP_API CorvoEffectBase {
public:
    static constexpr int MaxNumChannels = 2;  // of the effects here; what they do with more, each says

    CorvoEffectBase(const CorvoEffectBase&) = delete;
    CorvoEffectBase& operator=(const CorvoEffectBase&) = delete;

protected:
    // Storing one parameter and processing one block: what an effect is made of.

    // Stores real parameter `index` from its normalised value; true when derived state became stale. Called
    // on the user-interface thread, and for automation on the audio thread, where it neither allocates nor
    // waits.
    virtual bool DoSetParam(int index, float normalised, bool fromAutomation) = 0;
    // Processes one interleaved block in place, `frames` of `format`; 0 frames are left alone. Audio thread.
    virtual void ProcessInternal(double* buffer, int frames, const tWAVEFORMATEX* format,
                                 ProcessFlags& flags) = 0;
    // Processes one planar block in place; an effect that does not support those leaves it unchanged. Audio
    // thread.
    virtual void ProcessInternalNoninterleaved(double* const* channels, int frames,
                                               const tWAVEFORMATEX* format, ProcessFlags& flags);

public:
    // What the effect is. Any thread, at no cost, unless said otherwise; the answers do not change unless
    // said.

    // False: the effect has no sides to set apart, and SeparateLeftRightControls says 1.
    virtual bool HasSeparateLeftRightSettings();
    // In frames at the format of InitProcessing: how much later the output is than the input. May change with
    // parameters; ask after InitProcessing and after edits, on the user-interface thread.
    virtual int GetLatency();
    // True: both output channels carry the same signal, whatever comes in.
    virtual bool IsCollapsingToMono();
    // True: the host shows an editor made for this effect instead of its generic one.
    virtual bool HasNativeEditor();
    // The host's editor of this instance, or null. Not owned. User-interface thread.
    virtual void SetEditor(BuiltinEditor* editor);
    // False: the host hands over interleaved blocks only.
    virtual bool SupportsNoninterleaved();

    // Preparation.

    // The largest block to come. InitProcessing calls it first; an effect only takes note of it here.
    virtual void SetMaximumFramesPerBuffer(int frames);

    // Called when processing has ended.
    virtual ~CorvoEffectBase();

    // Re-derives coefficients when they are stale, `force` is set, or the format is not the last one seen.
    // With `force`, from InitProcessing, it also makes all memory and starts afresh; then it may allocate and
    // no block is being processed. Without, it runs in front of every block on the audio thread. It may throw
    // std::bad_alloc, which InitProcessing and Process catch.
    virtual void CheckCookProperties(const tWAVEFORMATEX* format, bool force);

    // State, on the user-interface thread: the settings chunk is a little-endian layout, at present of
    // GetSettingsChunkSize() bytes.

    // Makes `chunk` exactly that long and writes it.
    virtual void GetSettingsChunk(std::vector<std::uint8_t>& chunk);
    // Its length in bytes with the settings of now.
    virtual int GetSettingsChunkSize();
    // Takes a chunk as a whole, or leaves everything as it was when it is too short for any layout the effect
    // had. Bytes after the layout are not read. What the values mean is limited where they are used.
    virtual void SetSettingsChunk(const std::vector<std::uint8_t>& chunk);
    // Clears delay lines, filters and detectors, and frees what they use; InitProcessing follows before the
    // next block. No block is being processed.
    virtual void Cleanup();

    // Presets, numbered from 0. A number out of range has no name and changes nothing. User-interface thread.
    virtual int NumPresets();
    virtual std::string GetPresetName(int preset);
    virtual void SetPreset(int preset);

    // Parameters, on the user-interface thread.

    // What a control shows at a normalised value, unit included. Empty for an index the effect does not have.
    virtual std::wstring GetParameterFormattedText(int index, double value);  // external index
    // What the host calls it; a side, " L" or " R", is left out.
    virtual std::wstring GetParamName(int index);  // external index
    // Empty where there is none.
    virtual std::wstring GetParamUnitsText(int index);  // external index
    // 0..1; setting it again changes nothing. 0 for an index the effect does not have.
    virtual float GetParam(int index) = 0;  // external index
    // The stored value, not normalised; 0 for an index the effect does not have.
    virtual float GetParamPlain(int index) const;  // real index
    // How many parameters the effect itself has.
    virtual int GetParamCountReal() = 0;
    // As the host shows it; different for every effect.
    virtual std::string GetName() = 0;
    // True for pitch correction only, which the host offers under a name of its own.
    virtual bool IsCantrix();
    // Stores the normalised value of an external parameter, both sides of it where it is a pair. Automation
    // calls it on the audio thread, with real indices.
    virtual void SetParam(int index, float normalised, bool fromAutomation);
    // How many the host shows: a pair that is controlled as one counts once.
    virtual int GetParamCount();
    // How the host automates a parameter.
    virtual EffectParameterType GetParameterTypeAutomatable(int index);  // external index

    // Presentation and side-chain, on the user-interface thread.

    // The preset that a new instance starts from.
    virtual int GetDefaultPreset();
    // True: the host keeps its XY editor's state with the effect; see InitializeXyEditingData.
    virtual bool WantsXySerialization();
    // True: the effect processes one channel only.
    virtual bool IsMono() const;
    // The file name of the picture that the host shows for the effect; empty: none.
    virtual std::string GetImage();
    // How many side-chains the effect can listen to, and to how many channels of one that it has.
    virtual int GetNumSidechainBusses();
    virtual int GetSidechainBusNumChannelsMax(int bus);
    // The buffers of the next block on side-chain `bus`: planar, one per channel announced, in the
    // block's own precision. Not owned; read by that block only. Audio thread.
    virtual void SetSidechainBuffer(int bus, double* const* channels);
    // The texts of a list's choices, in order; empty for everything else.
    virtual std::vector<std::string> GetParameterAvailableValues(int index);  // external index
    // 0: one external parameter stands for the left and the right real one; 1: every real one has its own.
    virtual int SeparateLeftRightControls();
    // True: the host lets its user type a value, which GetParamValueNormalizedFromText reads.
    virtual bool AllowChangeParamFromInputBox(int index);  // external index
    // Parses what GetParameterFormattedText shows, limited to 0..1; -1 when the effect does not understand
    // the text. Effects that parse numbers throw std::invalid_argument or std::out_of_range for text that
    // holds none.
    virtual float GetParamValueNormalizedFromText(int index, std::string text);  // external index
    // Columns of the generic editor's tab; -1: no preference.
    virtual int GetPreferredNumColumnsForTab() const;
    // How the generic editor lays out one parameter. `info` is left alone by effects that leave that to the
    // host. The layout may change with the format: see WantsUpdateUiFromScratch.
    virtual void GetParamSectionInfo(int index, PluginParameterInfo& info);  // external index
    // Titles of the generic editor's sections, which PluginParameterInfo::layout_group numbers; empty: one
    // section without a title.
    virtual std::vector<std::string> GetParamUiSections();
    // The icon's path within the host's resources; empty: none.
    virtual std::string GetPluginIconPath();
    // The colours of the host's generic editor.
    virtual PluginGenericUILookAndFeel GetLookAndFeel();
    // Between blocks, when the host starts to play from another place: effects with a delay line clear it,
    // all others do nothing. `reset` is the host's word for whether the stream begins anew; no effect needs
    // it.
    virtual void InitResetProcessingLight(bool reset);
    // Fills the pads of the host's XY editor; `data` is left alone by effects without pads.
    virtual void InitializeXyEditingData(GenericUIData& data);
    // Normalised value of real parameter `index` in a preset; -1 without preset data.
    virtual float GetParamFromProp(int index, int preset);

    // Announces the format and the largest block, and derives everything; all memory that processing
    // needs is made here. Always true, and never throws: without memory blocks pass unchanged, and the next
    // InitProcessing tries again.
    bool InitProcessing(int maxFrames, const tWAVEFORMATEX* format);
    // False when the last preparation found no memory: sound passes unchanged until the next one.
    bool IsPrepared() const;
    // Plays automation that is due, then processes one block in place. Never throws; a block of 0 frames
    // or fewer is left alone. An effect that remembers its input takes samples that are not finite for 0, and
    // what overflows inside it is cleared when that shows: the next block is sound again.
    void Process(double* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags& flags);
    void ProcessNoninterleaved(double* const* channels, int frames, const tWAVEFORMATEX* format,
                               ProcessFlags& flags);
    // The same for a block of floats; the format says 32 bits.
    template <std::same_as<float> Float>
    void Process(Float* buffer, int frames, const tWAVEFORMATEX* format, ProcessFlags& flags) {
        Process(reinterpret_cast<double*>(buffer), frames, format, flags);
    }

    // Ringing out, on the audio thread and between blocks. When the stream has ended:
    //   1. StartTail, with the most frames that the tail may have;
    //   2. blocks of silence until TailFinished(): of each, the first TailFramesProduced() frames are output;
    //   3. EndTail.
    // Echo, chorus and flanger know how long one pass of their delay line rings and finish after it; feedback
    // leaves more, which blocks of silence after EndTail bring out. Every other effect finishes at the limit.
    // So a host that wants all of it goes on after EndTail until it hears silence.
    void StartTail(std::int64_t maxFrames);  // 0 or below finishes with the next block, without output
    void EndTail();
    bool InTail() const;
    int TailFramesProduced() const;  // of the last block; outside the tail all its frames
    bool TailFinished() const;
    // For a host that begins another stream without InitProcessing: the next block starts at the beginning of
    // the delay lines, which keep what they hold, and a whole pass is left to ring.
    void RequestTailRestart();

    void SetHostCallback(CorvoEffectHostCallback* callback);  // not owned; null for none
    // Null for none.
    CorvoEffectHostCallback* GetHostCallback() const { return m_host_callback; }
    // The host calls this when tempo or time signature changed: the next block derives afresh.
    void NotifyTempoChanged();
    // Raised when an edit changed more than its own parameter, so that the host shows all of them anew; the
    // host lowers it. User-interface thread.
    void SetWantRefreshAllParams(bool want);
    bool WantRefreshAllParams();
    // True after the set of visible controls changed; any thread.
    bool WantsUpdateUiFromScratch() const;
    void SetUpdateUiFromScratch(bool want);

    // Announces a side-chain bus. Buses are announced in ascending order: announcing one discards all
    // above it.
    void SetSidechainBusNumChannels(int bus, int channels);
    int GetSidechainBusNumChannels(int bus);  // of a bus that was announced

    // Replaces the automation of one real parameter. Segments are kept in the order given; each is a jump
    // to valStart at rtStart, and the first applies at once whatever its start. Playback goes on from the
    // segment it had reached. A count of 0 or below, or null, empties the envelope.
    void AddEnvelope(int index, int count, const MP_ENVELOPE_SEGMENT* segments);
    // The stream position of the next block, in the units of the segments. A cook rewinds it to 0, so a
    // host that automates sets it before every block.
    void SetEnvelopeTime(std::int64_t time);
    std::int64_t GetEnvelopeTime() const;

    // What the host needs to know of an external parameter below GetParamCount(), choices included. Without a
    // table the choices are those of GetParameterAvailableValues, at even distances from 0 to 1.
    ParameterDescription Describe(int index);
    // False when envelopes are kept but never played.
    bool PlaysAutomation() const;
    // Seconds that may pass between two echoes of one sound with the settings and format of the last block or
    // InitProcessing; 0 when there are none. A host that waits for silence waits as long. Between blocks.
    double LongestGap() const;

    std::vector<int> GetAllSupportedParameterIds();  // 0 to real count - 1
    // One normalised value per parameter, in external order; -1 without preset data.
    std::vector<float> GetPresetValues(int preset);
    // A pad for InitializeXyEditingData, made of its four fields.
    static PluginParamXYGroupInfo MakeGroup(const std::string& name, int index, const std::vector<int>& xAxis,
                                            const std::vector<int>& yAxis);

protected:
    CorvoEffectBase();
    // For an effect that is described by a table. `settings` is its record of `table.chunk.words` 32-bit
    // words, which the two threads share; both live as long as the effect.
    CorvoEffectBase(const EffectTable& table, void* settings);

    // The row of an external parameter, and of a real one; null without a table or where there is none.
    const ParameterRow* RowOf(int external);
    const ParameterRow* RealRow(int real) const;
    const ParameterRow* WordRow(
        int real) const;  // null where the parameter is not a word of the settings, too
    // The real index of an external parameter, of the left one where it is a pair.
    int RealIndex(int external);
    // The table as records that live as long as the library; null without a table.
    const MP_PARAMINFO* TableRecords() const;

    // Settings as a whole: stores those of a preset, or of a chunk in today's layout or the oldest one
    // (`wide`), and marks the effect stale. False, with nothing changed, when there is no such preset or the
    // chunk does not fit; the chunk's leading word goes to `leading`.
    bool TakePreset(int preset);
    bool TakeChunk(const std::vector<std::uint8_t>& chunk, std::int32_t& leading, bool wide = false);
    void WriteChunk(std::vector<std::uint8_t>& chunk, std::int32_t leading) const;

    // The next block derives afresh. Any thread.
    void MarkStale() { m_cook.store(true, std::memory_order_release); }
    // Lowers the flag and takes note of the format. `due`: derived state is stale, because the flag was up,
    // the number of channels or the rate is not that of `seen`, or the host forces it. `afresh`: for either
    // of the last two.
    struct Cook {
        bool due, afresh;  // as above
    };
    Cook TakeCook(tWAVEFORMATEX& seen, const tWAVEFORMATEX& now, bool force);

    // Removes the segments of one parameter that lie wholly inside [from, to).
    void FlushEnvelope(int index, std::int64_t from, std::int64_t to);
    // With reset: sizes the envelope arrays for the real parameters and rewinds all of them.
    void InitEnvelopes(bool reset);
    // Applies every segment that is due and reports it in `flags`.
    void UpdateEnvelopes(ProcessFlags& flags);

    // Tempo and time signature of the host; 120 bpm and 4/4 where there is none.
    struct Tempo {
        double bpm = 120.0;                  // beats a minute, above 0
        int numerator = 4, denominator = 4;  // each 1 or above
    };
    Tempo HostTempo() const;

    BuiltinEditor* m_editor = nullptr;                          // the host's
    bool m_want_refresh_all_params = false;                     // what WantRefreshAllParams says
    bool m_reverse_param_order = false;                         // external index 0 is the last real one
    std::vector<int> m_sidechain_bus_channels;                  // of each bus announced
    CorvoEffectHostCallback* m_host_callback = nullptr;         // the host's
    std::atomic<bool> m_update_ui_from_scratch{false};          // what WantsUpdateUiFromScratch says
    std::vector<std::vector<MP_ENVELOPE_SEGMENT>> m_envelopes;  // one per real parameter
    std::vector<int> m_envelope_positions;                      // of each, the segment that comes next
    std::int64_t m_envelope_time = 0;                           // what GetEnvelopeTime says
    // Raised with release after an edit is stored, lowered with acquire before it is read.
    std::atomic<bool> m_cook{true};
    std::unique_ptr<TailRecord> m_tail;  // null until the effect has memory for it
    double m_longest_gap = 0.0;          // what LongestGap says; kept by cooks

private:
    void Store(const std::vector<std::uint32_t>& settings);
    template <typename Call>
    void Attempt(Call&& call);
    template <typename Call>
    void RunBlock(int frames, ProcessFlags& flags, Call&& call);

    const EffectTable* m_table = nullptr;
    void* m_words = nullptr;
};

}  // namespace Corvo::DSP
