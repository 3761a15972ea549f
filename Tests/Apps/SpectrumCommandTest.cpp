#include <gtest/gtest.h>

#include <algorithm>
#include <sstream>
#include <string>
#include <vector>

#include "Apps/Program.h"
#include "Support/Signals.h"

namespace AppTest {
namespace {

class SpectrumCommand : public Program {
protected:
    static void SaveSine(std::size_t frames, double hz) {
        const auto sine = TestSupport::Sine<double>(frames, hz, 48000, 1.0, 2);
        Save("in.wav", {2, 48000, SF_FORMAT_WAV | SF_FORMAT_DOUBLE, sine});
    }
};

// Whatever the window and length: 0 dB on the bin's centre, one row a bin.
TEST_F(SpectrumCommand, ReadsZeroDecibelsForAFullScaleSine) {
    for (const int length : {128, 4096, 32768})
        for (const std::string window : {"rectangular", "triangular", "hann", "hamming", "blackman"}) {
            SCOPED_TRACE(window + " " + std::to_string(length));
            const int bin = length / 8 + 3;
            SaveSine(2 * static_cast<std::size_t>(length) + 77, 48000.0 * bin / length);
            const auto result = Run(
                {"spectrum", "in.wav", "--csv", "-", "--window", window, "--length", std::to_string(length)});
            ASSERT_EQ(result.status, 0) << result.err;
            std::istringstream rows(result.out);
            std::string line;
            std::getline(rows, line);
            EXPECT_EQ(line, "frequency_hz,level_db");
            std::vector<double> hertz, level;
            for (double f, db; rows >> f && rows.get() == ',' && rows >> db;) {
                hertz.push_back(f);
                level.push_back(db);
            }
            ASSERT_EQ(level.size(), static_cast<std::size_t>(length / 2));
            const auto top = std::max_element(level.begin(), level.end());
            EXPECT_NEAR(*top, 0.0, 0.002);
            EXPECT_EQ(top - level.begin(), bin);
            EXPECT_NEAR(hertz[static_cast<std::size_t>(bin)], 48000.0 * bin / length, 1e-3);
        }
}

// No window is whole, or none after the first: one spectrum, not a division by zero.
TEST_F(SpectrumCommand, TakesShortInputs) {
    SaveSine(4100, 3750.0);
    for (const char* overlap : {"0", "0.27", "0.99"}) {
        const auto result = Run({"spectrum", "in.wav", "--csv", "-", "--overlap", overlap});
        ASSERT_EQ(result.status, 0) << result.err;
        const std::string text = result.out.substr(result.out.find("\n3750.0000,") + 11);
        EXPECT_NEAR(std::stod(text), 0.0, 0.002) << overlap;
    }
    EXPECT_EQ(Run({"spectrum", "in.wav", "--csv", "-", "--length", "8192"}).status, 0);
}

TEST_F(SpectrumCommand, RefusesWhatItCannotDo) {
    SaveSine(4096, 1000.0);
    ExpectRefused(Run({"spectrum", "in.wav", "--csv", "o.csv", "--length", "1000"}), 2, {"--length", "1000"});
    ExpectRefused(Run({"spectrum", "in.wav", "--csv", "o.csv", "--overlap", "1"}), 2, {"--overlap", "0.99"});
    ExpectRefused(Run({"spectrum", "in.wav", "--csv", "o.csv", "--window", "gauss"}), 2, {"gauss", "hann"});
    ExpectRefused(Run({"spectrum", "in.wav", "--csv", "in.wav", "-y"}), 2, {"in.wav", "input"});
}

}  // namespace
}  // namespace AppTest
