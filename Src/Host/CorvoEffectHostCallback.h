#pragma once

// What an effect may ask its host. The host implements it, owns it, and keeps it alive for as long as an
// effect holds it. Both operations are called on the audio thread and on the user-interface thread, so
// they must neither wait nor throw.
class CorvoEffectHostCallback {
public:
    virtual ~CorvoEffectHostCallback() = default;
    // Beats per minute. 0 or below, or NaN, counts as 120.
    virtual double GetTempo() = 0;
    // Such as 3 and 4. What is 0 or below counts as 4.
    virtual void GetTimeSignature(int& numerator, int& denominator) = 0;
};
