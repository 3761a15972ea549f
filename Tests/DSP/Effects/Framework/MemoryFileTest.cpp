#include "DSP/Effects/Framework/MemoryFile.h"

#include <gtest/gtest.h>

#include <limits>

using Corvo::CorvoException;
using KivFiles::CMemoryFile;

// Catches positions and counts that reach outside the buffer.
TEST(MemoryFile, ReadsOnlyWhatIsThere) {
    constexpr std::int64_t kFar = std::numeric_limits<std::int64_t>::max();
    CMemoryFile file;
    const char text[] = "hello";
    file.Seek(1000, CMemoryFile::FromStart);
    EXPECT_EQ(file.Write(text, 5), 5);
    EXPECT_EQ(file.GetLength(), 1005);
    EXPECT_EQ(file.GetPosition(), 1005) << "asking for the length leaves the position";

    constexpr std::int64_t kCases[][3] = {{1000, 5, 5},  {1003, 5, 2},    {1005, 5, 0},
                                          {2000, 5, 0},  {-1, 5, 0},      {1000, 0, 0},
                                          {1000, -1, 0}, {1004, kFar, 1}, {kFar, kFar, 0}};
    for (const auto& [position, count, expected] : kCases) {
        char read[8] = "-------";
        file.Seek(position, CMemoryFile::FromStart);
        EXPECT_EQ(file.Read(read, count), expected) << position << ", " << count;
        EXPECT_EQ(file.GetPosition(), position + expected);
        EXPECT_EQ(read[expected], '-') << "wrote past what it returned";
    }
    file.Seek(-5, CMemoryFile::FromStart);
    EXPECT_EQ(file.Write(text, 5), 0);
    EXPECT_EQ(file.Data()[999], 0) << "the gap";
    EXPECT_EQ(file.Seek(10, CMemoryFile::FromEnd), 995);
    EXPECT_EQ(file.Seek(5, CMemoryFile::FromCurrent), 1000);
    EXPECT_THROW(file.Write(text, kFar), CorvoException) << "more than there is memory for";
}

TEST(MemoryFile, StreamsArraysOfDoubles) {
    const std::vector<double> values{0.0, -1.5, 1e300};
    CMemoryFile file;
    KivFiles::WriteDoubles(file, values);
    EXPECT_EQ(file.GetLength(), 4 + 3 * 8);
    EXPECT_EQ(file.Data()[0], 3) << "little-endian";
    std::vector<double> read;
    for (const bool unbounded : {false, true}) {
        read.clear();
        file.SetUnbounded(unbounded);  // such a file does not know its length
        file.Seek(0, CMemoryFile::FromStart);
        KivFiles::ReadDoubles(file, read);
        EXPECT_EQ(read, values);
    }
    file.SetUnbounded(false);
    // A count that the bytes cannot hold must neither be believed nor spoil what the caller has.
    for (const std::int32_t count : {4, std::numeric_limits<std::int32_t>::max(), -1}) {
        file.Seek(0, CMemoryFile::FromStart);
        file.Write(&count, 4);
        file.Seek(0, CMemoryFile::FromStart);
        EXPECT_THROW(KivFiles::ReadDoubles(file, read), CorvoException) << count;
        EXPECT_EQ(read, values);
    }
}
