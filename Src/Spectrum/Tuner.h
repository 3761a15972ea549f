#pragma once

#include "Platform/Export.h"

// Told when the notes' frequencies must be worked out again.
class DSP_API TuningListener {
public:
    virtual ~TuningListener();
    virtual void NotesMustBeRecomputed() = 0;
};

// The tuner's choices. All but the sensitivity are shared by every tuner; any thread may read and set them.
class DSP_API Tuner {
public:
    Tuner();

    // 0 denoised harmonic product, 1 harmonic product, 2 pseudo harmonic product, 3 legacy, 4 two-way
    // mismatch. Kept as given; any other value works as 3.
    static void SetDetectionMethod(int method);
    static int GetDetectionMethod();

    static void SetShowDenoisedSpectrum(bool show);
    static bool GetShowDenoisedSpectrum();

    // 0 Equal .. 10 Vallotti; an index outside is stored as 0. A temperament other than the current one marks
    // it changed and tells the listener.
    static void SetTemperament(int temperament);
    static int GetTemperament();
    static bool IsTemperamentChanged();
    // The listener stays the caller's; null for none.
    static void SetTuningListener(TuningListener* listener);

    // 0..2; anything else is stored as 0.
    static void SetNoteNaming(int naming);
    static int GetNoteNaming();

    // Cents within which a note counts as tuned. Presets 0..5 are 0.1, 0.5, 1, 2, 5 and 10; any other is 2.
    static void SetTunedQuantum(float cents);
    static float GetTunedQuantum();
    static void SetTunedQuantumPreset(int preset);

    // 0 Standard .. 5 Very high frequencies; an index outside changes nothing. Reading back gives 2 for both
    // Standard and Sensitive.
    void SetSensibilityPreset(int preset);
    int GetSensibilityPreset() const;

private:
    int m_sensitivity = 0;
};
