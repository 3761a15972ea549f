#include <gtest/gtest.h>

#include <array>
#include <filesystem>
#include <iterator>
#include <memory>
#include <string>

#include "Apps/Program.h"
#include "Errors.h"
#include "OutputFile.h"

#if !defined(_WIN32)
#include <sys/stat.h>
#include <unistd.h>
#endif

#if defined(__linux__)
#include <sys/syscall.h>

// Stands in front of the system's: how often it stored before there was a file "a", and after.
static int g_early, g_late;
extern "C" int fsync(int descriptor) {
    ++(std::filesystem::exists("a") ? g_late : g_early);
    return static_cast<int>(syscall(SYS_fsync, descriptor));
}
#endif

// What becomes of files that are there before, or come meanwhile.
namespace AppTest {
namespace {

namespace fs = std::filesystem;
using dsphost::OutputFile;

class Outputs : public Program {
protected:
    static std::unique_ptr<OutputFile> Open(const std::string& path, bool overwrite) {
        auto file = std::make_unique<OutputFile>(path, dsphost::OutputRules{overwrite, {}});
        file->Bytes().Write("new", 3);
        return file;
    }
};

TEST_F(Outputs, AppearTogetherOrNotAtAll) {
    for (const bool overwrite : {false, true}) {
        SCOPED_TRACE(overwrite);
        fs::remove("a");
        if (overwrite) SaveBytes("a", "old");
        auto a = Open("a", overwrite), b = Open("b", false);
        SaveBytes("b", "theirs");
        EXPECT_THROW(dsphost::CommitTogether(std::array{a.get(), b.get()}), dsphost::IoError);
        a.reset(), b.reset();
        EXPECT_EQ(Bytes("a"), overwrite ? "old" : "");
        EXPECT_EQ(Bytes("b"), "theirs");
        EXPECT_EQ(std::distance(fs::directory_iterator("."), {}), overwrite ? 2 : 1);
        fs::remove("b");
    }
    auto a = Open("a", true), b = Open("b", false);
    dsphost::CommitTogether(std::array{a.get(), b.get()});
    a.reset(), b.reset();
    EXPECT_EQ(Bytes("a") + Bytes("b"), "newnew");
    EXPECT_EQ(std::distance(fs::directory_iterator("."), {}), 2);
}

#if !defined(_WIN32)
// Also where nothing is behind the link yet.
TEST_F(Outputs, FollowLinksAndKeepThem) {
    fs::create_directory("folder");
    fs::create_symlink("folder/far.wav", "link.wav");
    fs::create_symlink("circle.wav", "circle.wav");
    Save("in.wav", NoiseSound(10));
    for (const std::string option : {"", " -y"}) {
        Succeed("render in.wav link.wav" + option);
        EXPECT_TRUE(fs::is_symlink("link.wav"));
        EXPECT_EQ(Bytes("folder/far.wav"), Bytes("in.wav"));
    }
    ExpectRefused(Run("render folder/far.wav link.wav -y"), "link.wav|input");
    ExpectRefused(Run("render in.wav circle.wav -y"), "circle.wav|link");
}
#endif

#if defined(__linux__)
TEST_F(Outputs, AreOnTheDiskBeforeTheyHaveTheirName) {
    g_early = g_late = 0;
    Open("a", false)->Commit();
    EXPECT_EQ(g_early, 1);
    EXPECT_EQ(g_late, 0);
}
#endif

// Names that leave no room for what is put behind them, and names that are not of this place.
TEST_F(Outputs, HaveAnyName) {
    for (const std::string& name :
         {std::string(251, 'n') + ".wav", std::string("\xC5\xBC\xE9\x9F\xB3 \xF0\x9F\x8E\xB5.wav")}) {
        Open(name, false)->Commit();
        EXPECT_EQ(fs::file_size(dsphost::PathOf(name)), 3u);
    }
}

#if !defined(_WIN32)
TEST_F(Outputs, KeepOwnerAndPermissionsAndWhatIsProtected) {
    Save("in.wav", NoiseSound(10));
    SaveBytes("theirs.wav", "old");
    SaveBytes("kept.wav", "old");
    const bool root = geteuid() == 0;
    ASSERT_EQ(chown("theirs.wav", root ? 1234 : geteuid(), root ? 567 : getegid()), 0);
    ASSERT_EQ(chmod("theirs.wav", 0646), 0);
    ASSERT_EQ(chmod("kept.wav", 0444), 0);
    struct stat before {
    }, after{};
    stat("theirs.wav", &before);
    Succeed("render -y in.wav theirs.wav");
    stat("theirs.wav", &after);
    EXPECT_NE(after.st_ino, before.st_ino);
    EXPECT_EQ(after.st_uid, before.st_uid);
    EXPECT_EQ(after.st_gid, before.st_gid);
    EXPECT_EQ(after.st_mode, before.st_mode);
    ExpectRefused(Run("render -y in.wav kept.wav"), "kept.wav|write-protected");
    const auto late = Open("late.wav", true);
    SaveBytes("late.wav", "theirs");
    ASSERT_EQ(chmod("late.wav", 0444), 0);
    EXPECT_THROW(late->Commit(), dsphost::IoError);
    EXPECT_EQ(Bytes("late.wav"), "theirs");
    EXPECT_THROW(Open(std::string(252, 'n') + ".wav", false), dsphost::UserError);  // before all the work
    ExpectRefused(Shell("DSPHOST render -y - in.wav < in.wav"), "in.wav|input");
    ExpectRefused(Shell("DSPHOST render in.wav - >> in.wav"), "standard output|input");
    // What is printed of a name stays on its line.
    ExpectRefused(Run("render '\x1B[31m\n\xC5\xBC\xC2\x85\x9B\xE2\x80\xAE.wav' o.wav"),
                  "\\x1b[31m\\n\xC5\xBC\\x85\\x9b\\u202e.wav");
    const auto mixed = Shell("DSPHOST render in.wav - --fx Gain --save-chunk /dev/stdout | wc -c");
    EXPECT_EQ(std::stoi(mixed.out), 0) << mixed.err;
}
#endif

}  // namespace
}  // namespace AppTest
