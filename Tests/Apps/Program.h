#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include <sndfile.hh>

namespace AppTest {

struct Result {
    int status = -1;
    std::string out, err;
};

constexpr int kPcm16 = SF_FORMAT_WAV | SF_FORMAT_PCM_16, kDouble = SF_FORMAT_WAV | SF_FORMAT_DOUBLE;

// A sound file's contents.
struct Sound {
    int channels = 2, rate = 48000, format = kPcm16;
    std::vector<double> samples;  // interleaved, full scale 1
    std::size_t Frames() const { return samples.size() / static_cast<std::size_t>(channels); }
};
void Save(const std::string& path, const Sound& sound);
Sound Load(const std::string& path);
// `frames` of noise that 16 bits hold exactly.
Sound NoiseSound(std::size_t frames, int channels = 2, int format = kPcm16);

std::string Bytes(const std::string& path);
void SaveBytes(const std::string& path, const std::string& bytes);
// The cells of a table below its heading, which must be this one.
std::vector<std::vector<std::string>> Rows(const std::string& csv, const std::string& heading);

// Runs dsphost as a person would, every test in an empty directory of its own.
class Program : public testing::Test {
protected:
    Program();
    ~Program() override;

    // dsphost with these arguments, as the system's shell takes them; `input` goes to standard input.
    Result Run(const std::string& arguments, const std::string& input = {});
    // The same, expected to succeed; returns its standard output.
    std::string Succeed(const std::string& arguments, const std::string& input = {});
    // A line for the system's shell, in which DSPHOST stands for the program.
    Result Shell(std::string line);
    // One line on standard error that holds all of `words` ("this|and that"), the exit status, and no file
    // more than before.
    void ExpectRefused(const Result& result, const std::string& words, int status = 2);

private:
    std::filesystem::path m_directory, m_before;
    std::vector<std::string> m_files;
};

}  // namespace AppTest
