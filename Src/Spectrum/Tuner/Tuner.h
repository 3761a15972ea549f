#pragma once

#include <array>
#include <atomic>
#include <memory>
#include <string>
#include <vector>

#include "Platform/Export.h"

namespace Corvo {
class Analyser;
class PitchDetector;
struct NearestNote;
}  // namespace Corvo

// Listeners stay the caller's. One that is replaced or taken away may still be called by the command or
// analysis that is running at that moment, and has to live until then.
//
// Told when the notes' frequencies must be worked out again: another temperament or calibration. Called on
// the thread that changed it, from menu commands with the analysers' class-wide lock held: it must not wait
// for another thread, and calls no analyser but to post.
class DSP_API TuningListener {
public:
    virtual ~TuningListener();
    // CookNotesFrequencies does so.
    virtual void NotesMustBeRecomputed() = 0;
};

// Told by one tuner that the note it shows is another, or gone. Called on the display thread, without a lock.
class DSP_API TunerDisplayListener {
public:
    virtual ~TunerDisplayListener();
    // `present`: there is a note.
    virtual void NoteChanged(bool present) = 0;
};

// A note with its octave.
struct TunedNote {
    int note = -1;   // 0 A to 11 G#; negative for none
    int octave = 0;  // changes at C: 440 Hz is the A of octave 4
    bool operator==(const TunedNote&) const = default;
};

// Finds the pitch in its analyser's spectra, the nearest note of the chosen temperament and the error.
//
// Class-wide choices are shared by every tuner; any thread may read and set them. The sensitivity may be set
// by any thread, too. Analyses run on the analyser's display thread, one at a time; what they found may be
// read anywhere, value by value: two values may stem from two analyses.
//
// A pitch below some 6 bins of the window (6 sampling rate / window length: 32 Hz with 8192 samples at
// 44.1 kHz, 70 Hz at 96 kHz) cannot be told apart from its overtones, whatever the sensitivity allows; lower
// ones want a longer window.
//
// Cost: an analysis passes over the spectrum a few times. Everything else only reads or stores a value.
class DSP_API Tuner {
public:
    // Silent, with the sensitivity "Standard".
    Tuner();
    ~Tuner();
    Tuner(const Tuner&) = delete;
    Tuner& operator=(const Tuner&) = delete;

    // 0 denoised harmonic product: the candidate whose partials, in decibels above the noise floor, explain
    // most of what is heard, less for partials that are missing. 1 harmonic product, of five spectra (M. R.
    // Schroeder, "Period histogram and product spectrum", J. Acoust. Soc. Am. 43, 1968). 2 pseudo harmonic
    // product: the largest sum of the first partials' levels. 3 legacy: the strongest partial
    // or what it is an overtone of. 0 and 2 add up decibels, as the logarithm of method 1's product does, but
    // over partials alone; they and 3 are this library's own. 4 two-way mismatch (R. C. Maher and J. W.
    // Beauchamp, "Fundamental frequency estimation of musical signals using a two-way mismatch procedure", J.
    // Acoust. Soc. Am. 95, 1994). Kept as given; any other value works as 3.
    static void SetDetectionMethod(int method);
    static int GetDetectionMethod();

    // Whether the spectrum without its noise floor is made along with each analysis. Changes nothing in what
    // is heard.
    static void SetShowDenoisedSpectrum(bool show);
    static bool GetShowDenoisedSpectrum();

    // 0 Equal to 10 Vallotti. 1 Pythagorean: pure fifths from E flat to G sharp. 2, 7, 8 and 9 Meantone: each
    // of them narrower by 1/4, 1/7, 2/7 and 1/3 of a syntonic comma. 3 Werckmeister III: C-G-D-A and B-F#
    // narrower by 1/4 of a Pythagorean comma; 10 Vallotti: C-G-D-A-E-B-F# by 1/6. 4 to 6 Just: A-E, and Bb-F
    // in 4, narrower by a whole syntonic comma. All other fifths are pure but the one that closes the circle.
    // Cf. J. M. Barbour, "Tuning and Temperament: A Historical Survey", 1951.
    //
    // One other than the current one is marked as changed and told to the listener; the notes follow at the
    // next CookNotesFrequencies. Negative counts as 0; above 10 it is a change, too, and stored as 0.
    static void SetTemperament(int temperament);
    static int GetTemperament();
    // Until the notes have followed.
    static bool IsTemperamentChanged();
    // Empty outside 0..10.
    static const char* GetTemperamentName(int temperament);
    // Of the temperament in use.
    static const char* GetCurrentTemperamentName();
    // Null for none.
    static void SetTuningListener(TuningListener* listener);

    // Works out the notes for temperament and calibration, unless neither `force` nor a change asks for it.
    static void CookNotesFrequencies(bool force);
    // The octave of notes from the calibration base up, Hz: 0 A, 1 A#, 2 B, 3 C to 11 G#, 12 the next A. 0
    // outside.
    static double GetNoteFrequency(int entry);
    // The A two octaves below the one the orchestra tunes to, Hz; 110 unless calibrated.
    static double GetCalibrationBase();

    // 0 letters with sharps, 1 letters with flats, 2 solfege; anything else is stored as 0.
    static void SetNoteNaming(int naming);
    static int GetNoteNaming();
    // The name of note 0 (A) to 11 (G#) in the current naming, without its octave; empty outside.
    static const char* GetNoteName(int note);

    // Cents within which a note counts as tuned. Presets 0..5 are 0.1, 0.5, 1, 2, 5 and 10; any other is 2.
    static void SetTunedQuantum(float cents);
    static float GetTunedQuantum();
    static void SetTunedQuantumPreset(int preset);

    // 0 Standard to 5 Very high frequencies; an index outside changes no value. Either way the tuner forgets
    // what it heard: what is shown at once, its memories at the next analysis, when the values take effect.
    // Reading back gives 2 for both Standard and Sensitive.
    //
    // A sensitivity says which pitches are sought; how far above the noise floor a partial must stand to keep
    // a note alive and how far to begin one, and how far below the loudest it may lie (method 1 has limits of
    // its own); how long a note is held and when it is dropped; how often another must be heard before it
    // replaces the note shown (a first one twice in succession, within 25 cents); and how many partials
    // method 2 sums.
    // Choosing method 1 makes these five until a sensitivity is set.
    void SetSensibilityPreset(int preset);
    int GetSensibilityPreset() const;
    // Empty outside 0..5.
    static const char* GetSensibilityPresetName(int preset);

    // Forgets the note and all that led to it. Any thread; the listener is told at the next analysis.
    void Forget();

    // Null for none.
    void SetDisplayListener(TunerDisplayListener* listener);

    // The shape of the window that the spectra come through, as in the analyser's settings (0 rectangular to
    // 4 Blackman, which it is until set; anything else counts as Blackman). Display thread.
    void SetWindowType(int type);

    // Runs one analysis. `power` holds |bin|^2, unscaled, of `fftLength` samples of which the first
    // `windowLength` were windowed and the rest, if any, were zero; entry 0 is no pitch. `transform` is
    // the packed spectrum itself, which no method needs. `hopLength` is the number of samples between
    // analyses, one window when below 1. `halveHarmonics` halves the overtones of the harmonic product;
    // `denoise` makes method 0 work on the spectrum without its noise floor, whatever method is chosen.
    // Nothing happens without spectrum, length or rate. Allocates only when the lengths change.
    void Tune(const std::vector<float>& power, const std::vector<float>& transform, int fftLength,
              int hopLength, int windowLength, int samplingRate, bool halveHarmonics, bool denoise);

    // A note is shown. It may have ended a moment ago: the sensitivity says for how long it stays.
    bool IsTuned() const;
    // It is closer to its place than the tuned quantum. False without a note, although the error is 0 then.
    bool IsTunedCentered() const;
    // Whether the note shown was heard only just now.
    bool IsTracking() const;
    // Note and octave of the same analysis, and either of them alone: 0 A to 11 G#, negative for no note; the
    // octave, 0 without one.
    TunedNote GetTunedNote() const;
    int GetNote() const;
    int GetOctave() const;
    // The pitch last heard of the note shown, Hz. 0 without a note.
    double GetFrequency() const;
    // Where the pitch shown was at the last analysis, Hz: that of the note, or where it has glided to since,
    // before another note is shown. 0 when it was not heard or no analysis has come for long, and for what is
    // heard but not shown yet.
    double GetHeardFrequency() const;
    // How far the pitch shown is from the note, positive when sharp. 0 without a note.
    float GetErrorCents() const;
    // By how many decibels the partials together (the product, with method 1) stood out. 0 without a note.
    float GetProminence() const;
    // The mean pitch of the last half second or a little more, if it stayed within 10 cents, else 0. Hz.
    double GetStableFrequency() const;

    // The name of the note shown; empty for none.
    const char* GetTunedNoteName() const;
    // The error as "+12.3c"; without a sign when it rounds to nothing. UTF-8: a flat note's sign is U+2212,
    // as on the dial. Empty without a note. Too short to allocate.
    std::string GetTuningErrorStr() const;
    static std::string GetTuningErrorStr(float cents);

    // The spectrum without its noise floor, as long as the one analysed; empty unless the last analysis made
    // it: with SetShowDenoisedSpectrum, or for its own use.
    // Belongs to the display thread.
    const std::vector<float>& GetDenoisedSpectrum() const;

private:
    friend class Corvo::Analyser;
    // Tune without telling the listener; true when it ought to be told. For the analyser, which does so when
    // it has let go of its lock.
    bool Analyse(const std::vector<float>& power, int fftLength, int hopLength, int windowLength,
                 int samplingRate, bool halveHarmonics, bool denoise);
    // Instead of it at a display refresh without a new frame: lets the time pass that a note is held for.
    bool Wait();
    void Announce();

    void DoAsAsked();
    void ResetPeakMemories(bool forgetNote);
    void Hear(double hz, float prominence, const Corvo::NearestNote& heard);
    // `seconds`: since the analysis before.
    void Follow(double hz, float prominence, double seconds);
    void RememberPitch(double hz, double seconds);
    void ForgetPitches();
    // After so many refreshes without the note shown.
    void Miss(double refreshes);
    void ClearShown();

    static constexpr int kLongestMemory = 18;  // analyses in half a second, 30 ms apart, both ends counted

    std::unique_ptr<Corvo::PitchDetector> m_detector;
    std::atomic<int> m_sensitivity{0};
    std::atomic<bool> m_presetChosen{true};
    std::atomic<bool> m_forgetAsked{false};
    std::atomic<TunerDisplayListener*> m_displayListener{nullptr};
    int m_windowType = 4;

    // What was found.
    std::atomic<TunedNote> m_shown{TunedNote{}};
    std::atomic<double> m_frequency{0.0};
    std::atomic<double> m_heardFrequency{0.0};
    std::atomic<float> m_cents{0.0f};
    std::atomic<float> m_prominence{0.0f};
    std::atomic<double> m_stableFrequency{0.0};
    std::atomic<bool> m_tracking{false};

    // Display thread only.
    TunedNote m_announced;
    TunedNote m_other;  // heard instead of the note shown, so often in succession
    int m_otherCount = 0;
    // In refreshes: between analyses, since the last one, and without the note shown up to that.
    double m_period = 1.0, m_waited = 0.0, m_missed = 0.0;
    std::array<double, kLongestMemory> m_pitches{};  // of the note shown, octaves above 1 Hz
    int m_pitchCount = 0;
};

// Takes the pitch that `tuner` hears for the nearest note: moves the calibration base by the note's error,
// but by at most 50 cents per call, and works out the notes. Where a temperament's notes lie further apart
// than 100 cents another call may be needed. False, with nothing changed, unless the pitch has stayed within
// 10 cents for half a second. Like the reset it tells the tuning listener. Any thread.
DSP_API bool TunerCalibrateNow(const Tuner& tuner);
// So that the A which the orchestra tunes to, two octaves above the base, has this frequency; false, with
// nothing changed, outside 220..880 Hz.
DSP_API bool TunerCalibrateTo(double concertPitchHz);
// Back to 440 Hz. Tells the tuning listener.
DSP_API void TunerCalibrateReset();
// Whether the base is another than 110 Hz.
DSP_API bool TunerIsNonstandardCalibration();
// Whether that is so, or the temperament is not the equal one.
DSP_API bool TunerCalibrationNotStandardOrNotUseEqualTemperament();
// Lines of text that belong below a shown note: error and frequency, and a third for calibration and
// temperament when they are not the usual ones.
DSP_API int TunerGetNumLines();
// Whether the note that `tuner` shows is being heard.
DSP_API bool TunerIsTracking(const Tuner& tuner);
// Works out the notes at once.
DSP_API void CookNotesFreqs();
