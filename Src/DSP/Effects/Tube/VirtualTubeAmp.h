#pragma once

#include <array>
#include <cstddef>

#include "Platform/Export.h"

namespace Corvo::DSP {

// The amplifier inside the tube distortion: its cooked values per side, the pre-filter's memories and the
// shaping functions. Owned by one thread at a time; nothing here allocates.
//
// The order of the virtual operations is part of the contract.
class DSP_API VirtualTubeAmp final {
public:
    // How many values there are, and what stands for all of them.
    static constexpr int kParameters = 10, kAllParameters = kParameters;
    using Values = std::array<float, kParameters>;  // normalised, left and right in turn

    VirtualTubeAmp();

    // Cooks parameter `changed` of `values`. kAllParameters cooks all and clears the pre-filter's memories.
    virtual void SetParameter(const Values& values, int changed);

    // The shaping functions on one sample, in -1..1. "Martens" takes its shape factor, the others the drive,
    // 0..1; "Doidic A." does not look at it. "Doidic" and "Araya" are curves of two patents, collected in
    // J. Pakarinen and D. T. Yeh, "A Review of Digital Techniques for Modeling Vacuum-Tube Guitar
    // Amplifiers", Computer Music Journal 33 (2009); "Martens" is (k + 1) x / (1 + k |x|), which meets 0 and
    // +-1.
    virtual double Martens(double sample, double shape) const;
    virtual double DoidicS(double sample, double shape) const;
    virtual double DoidicA(double sample, double shape) const;
    virtual double ArayaS(double sample, double shape) const;

    // Both work in place on interleaved frames of one channel (the left side's values) or two. The filter
    // takes samples that are not finite for 0.
    template <typename Sample>
    void FilterTone(Sample* samples, int frames, int channels);
    template <typename Sample>
    void Shape(Sample* samples, int frames, int channels) const;

    // The pre-filter starts from silence.
    void ClearMemories();

    static int OversamplingFactor(float normalised);  // 1, 2, 4, 8, 12 or 16
    static int FunctionIndex(float normalised);       // 0..3

private:
    static constexpr std::size_t kSides = 2;
    using Sides = std::array<double, kSides>;

    struct Side {
        float boost = 1.0f;
        float drive = 0.0f;
        float sine = 0.0f;         // "Martens": of the drive, below 1
        float shapeFactor = 0.0f;  // "Martens"
        float tone = 3.5f;         // the corner in radians per sample
        int function = 0;
        int oversampling = 1;

        bool ToneOn() const { return tone >= 0.1f && tone <= 3.0f; }
    };
    // Four equal first-order low-pass sections as one filter of order 4, transposed direct form; sides
    // stand next to each other so that they run together.
    struct PreFilter {
        Sides gain{};
        std::array<Sides, 4> feedback{}, memory{};
    };

    void DesignTone(std::size_t side);

    std::array<Side, kSides> m_sides;
    PreFilter m_filter;
};

}  // namespace Corvo::DSP
