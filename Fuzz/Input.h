#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <string>
#include <utility>
#include <vector>

namespace Fuzz {

// Turns the bytes of a fuzzer into decisions. Past the end everything reads as 0, so all bytes are a valid
// input, and a shorter one makes the same decisions up to its end. Each compiler reads the arguments of one
// call in an order of its own: at most one of them may ask for a decision.
class Input {
public:
    explicit Input(std::span<const std::uint8_t> bytes) : m_rest(bytes) {}

    bool AtEnd() const { return m_rest.empty(); }

    // The bit pattern as it comes: any number, NaN and infinities too.
    template <typename T>
    T Raw() {
        T value{};
        const std::size_t count = std::min(sizeof(T), m_rest.size());
        std::memcpy(&value, m_rest.data(), count);
        m_rest = m_rest.subspan(count);
        return value;
    }
    // Both ends included, at most 65536 apart.
    int Between(int lowest, int highest) {
        const auto choices = static_cast<unsigned>(highest - lowest + 1);
        const unsigned choice = choices > 256 ? Raw<std::uint16_t>() : Raw<std::uint8_t>();
        return lowest + static_cast<int>(choice % choices);
    }
    bool Flag() { return Between(0, 1) == 1; }
    template <typename T, std::size_t N>
    T OneOf(const T (&choices)[N]) {
        return choices[Between(0, static_cast<int>(N) - 1)];
    }
    // Mostly 0..1, now and then any number at all.
    float Value() {
        const int step = Between(0, 255);
        return step == 255 ? Raw<float>() : static_cast<float>(step) / 254.0f;
    }
    std::vector<std::uint8_t> Bytes(int longest) {
        const auto wanted = static_cast<std::size_t>(Between(0, longest));
        const auto count = std::min(wanted, m_rest.size());
        const auto bytes = m_rest.first(count);
        m_rest = m_rest.subspan(count);
        return {bytes.begin(), bytes.end()};
    }
    std::string Text(int longest) {
        const auto bytes = Bytes(longest);
        return {bytes.begin(), bytes.end()};
    }
    std::span<const std::uint8_t> Rest() { return std::exchange(m_rest, {}); }

    // A block of silence, of noise at some level, or of what comes.
    template <typename Sample>
    std::vector<Sample> Samples(std::size_t count) {
        std::vector<Sample> samples(count);
        static constexpr double kLevels[]{0.0, 1e-300, 0.25, 1.0, 1e9};
        const double level = OneOf(kLevels);
        auto state = Raw<std::uint16_t>() * 2654435761u;
        for (auto& sample : samples) {
            state = state * 1664525u + 1013904223u;
            sample = static_cast<Sample>(level * (state / 2147483648.0 - 1.0));
        }
        for (int strange = Between(0, 3); strange > 0 && count > 0; --strange)
            samples[Raw<std::uint16_t>() % count] = Raw<Sample>();
        return samples;
    }

private:
    std::span<const std::uint8_t> m_rest;
};

}  // namespace Fuzz
