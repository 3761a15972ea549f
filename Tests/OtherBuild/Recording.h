#pragma once

#include <cstdint>
#include <fstream>
#include <stdexcept>
#include <string>
#include <tuple>
#include <vector>

namespace OtherBuild {

// The fixed signal: a tone, noise, then silence, at this rate on two channels.
constexpr int kRate = 48000, kChannels = 2;
constexpr std::size_t kToneFrames = 24000, kNoiseFrames = 12000, kSilentFrames = 12000;

// What one effect gave in one scene: samples of the left and right channel in turn, the bytes of a settings
// chunk, or texts. Both builds are little-endian with IEEE numbers, so bytes are kept as they are.
enum class Kind : std::uint8_t { Float, Double, Chunk, Texts };

struct Take {
    std::string effect, scene;
    Kind kind = Kind::Float;
    std::vector<std::uint8_t> bytes;
};

inline void Save(const std::string& path, const std::vector<Take>& takes) {
    std::ofstream file(path, std::ios::binary);
    const auto put = [&](const auto& bytes) {
        const auto size = static_cast<std::uint64_t>(bytes.size());
        file.write(reinterpret_cast<const char*>(&size), sizeof size);
        file.write(reinterpret_cast<const char*>(bytes.data()), static_cast<std::streamsize>(size));
    };
    for (const auto& take : takes) {
        put(take.effect);
        put(take.scene);
        file.put(static_cast<char>(take.kind));
        put(take.bytes);
    }
    file.close();
    if (!file) throw std::runtime_error("cannot write " + path);
}

inline std::vector<Take> Load(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) throw std::runtime_error("cannot read " + path);
    const auto get = [&](auto& bytes) {
        std::uint64_t size = 0;
        file.read(reinterpret_cast<char*>(&size), sizeof size);
        if (!file || size > 1u << 30) throw std::runtime_error(path + " is damaged");
        bytes.resize(static_cast<std::size_t>(size));
        file.read(reinterpret_cast<char*>(bytes.data()), static_cast<std::streamsize>(size));
        if (!file) throw std::runtime_error(path + " is damaged");
    };
    std::vector<Take> takes;
    while (file.peek() != std::ifstream::traits_type::eof()) {
        Take& take = takes.emplace_back();
        get(take.effect);
        get(take.scene);
        take.kind = static_cast<Kind>(file.get());
        get(take.bytes);
    }
    return takes;
}

}  // namespace OtherBuild
