#include "Apps/Program.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <random>
#include <sstream>

#include "Support/Signals.h"

#if !defined(_WIN32)
#include <sys/wait.h>
#endif

namespace AppTest {
namespace fs = std::filesystem;

void Save(const std::string& path, const Sound& sound) {
    SndfileHandle file(path, SFM_WRITE, sound.format, sound.channels, sound.rate);
    ASSERT_TRUE(file) << path << ": " << file.strError();
    // As 32-bit integers: scaled by libsndfile a full scale of 1 would be one step too small.
    std::vector<int> integers;
    for (const double sample : sound.samples)
        integers.push_back(static_cast<int>(std::lrint(sample * 0x1p31)));
    const int subtype = sound.format & SF_FORMAT_SUBMASK;
    const auto count = std::ssize(integers);
    if (subtype == SF_FORMAT_FLOAT || subtype == SF_FORMAT_DOUBLE || subtype == SF_FORMAT_VORBIS)
        EXPECT_EQ(file.write(sound.samples.data(), count), count);
    else
        EXPECT_EQ(file.write(integers.data(), count), count);
}

Sound Load(const std::string& path) {
    SndfileHandle file(path);
    EXPECT_TRUE(file) << path << ": " << file.strError();
    if (!file) return {1, 0, 0, {}};
    Sound sound{file.channels(), file.samplerate(), file.format(), {}};
    sound.samples.resize(static_cast<std::size_t>(file.frames() * file.channels()));
    EXPECT_EQ(file.read(sound.samples.data(), std::ssize(sound.samples)), std::ssize(sound.samples));
    return sound;
}

Sound NoiseSound(std::size_t frames, int channels, int format) {
    Sound sound{channels, 48000, format,
                TestSupport::Noise<double>(frames * static_cast<std::size_t>(channels), 0.5)};
    for (double& sample : sound.samples) sample = std::nearbyint(sample * 0x1p15) * 0x1p-15;
    return sound;
}

std::string Bytes(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

void SaveBytes(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

std::vector<std::vector<std::string>> Rows(const std::string& csv, const std::string& heading) {
    std::istringstream lines(csv);
    std::string line;
    std::getline(lines, line);
    EXPECT_EQ(line, heading);
    std::vector<std::vector<std::string>> rows;
    while (std::getline(lines, line)) {
        std::istringstream cells(line);
        rows.emplace_back();
        while (std::getline(cells, line, ',')) rows.back().push_back(line);
    }
    return rows;
}

namespace {

std::vector<std::string> Files() {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(".")) names.push_back(entry.path().filename().string());
    std::ranges::sort(names);
    return names;
}

}  // namespace

Program::Program() : m_before(fs::current_path()) {
    m_directory = fs::temp_directory_path() / ("dsphost-test-" + std::to_string(std::random_device()()));
    fs::create_directory(m_directory);
    fs::current_path(m_directory);
}

Program::~Program() {
    fs::current_path(m_before);
    fs::remove_all(m_directory);
}

Result Program::Shell(std::string line) {
    const char* const other = std::getenv("DSPHOST");
    const auto quoted = [](const std::string& text) { return std::string("\"").append(text).append("\""); };
    const std::string program = quoted(other ? other : DSPHOST_PROGRAM);
    for (std::size_t at; (at = line.find("DSPHOST")) != line.npos;) line.replace(at, 7, program);
    const std::string out = m_directory.string() + "-out", err = m_directory.string() + "-err";
    m_files = Files();
    int status = std::system(("( " + line + " ) > " + quoted(out) + " 2> " + quoted(err)).c_str());
#if !defined(_WIN32)
    status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
#endif
    Result result{status, Bytes(out), Bytes(err)};
    fs::remove(out);
    fs::remove(err);
    return result;
}

Result Program::Run(const std::string& arguments, const std::string& input) {
    const std::string place = m_directory.string() + "-in";
    SaveBytes(place, input);
    const Result result = Shell("DSPHOST " + arguments + " < \"" + place + "\"");
    fs::remove(place);
    return result;
}

std::string Program::Succeed(const std::string& arguments, const std::string& input) {
    const Result result = Run(arguments, input);
    EXPECT_EQ(result.status, 0) << arguments << ": " << result.err;
    EXPECT_EQ(result.err, "") << arguments;
    return result.out;
}

void Program::ExpectRefused(const Result& result, const std::string& words, int status) {
    EXPECT_EQ(result.status, status) << result.err;
    EXPECT_EQ(std::ranges::count(result.err, '\n'), 1) << result.err;
    std::istringstream list(words);
    for (std::string word; std::getline(list, word, '|');)
        EXPECT_NE(result.err.find(word), std::string::npos) << word << " in " << result.err;
    EXPECT_EQ(Files(), m_files);
}

}  // namespace AppTest
