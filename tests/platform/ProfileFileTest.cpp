// The same cases run against the portable reader and writer on Linux and the system's profile calls on
// Windows, so they also show that a file written by one reads the same on the other.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <tuple>

#include "platform/ProfileFile.h"

using namespace ulvetta;
namespace fs = std::filesystem;

namespace {

class ProfileFileTest : public ::testing::Test {
protected:
    void SetUp() override {
        std::random_device seed;
        dir_ = fs::temp_directory_path() / ("ulvetta-profile-" + std::to_string(seed()));
        fs::create_directories(dir_);
        path_ = (dir_ / "Ulvetta.ini").string();
    }
    void TearDown() override { fs::remove_all(dir_); }

    void put(const std::string& bytes) { std::ofstream(path_, std::ios::binary) << bytes; }
    std::string bytes() const {
        std::ifstream in(path_, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), {});
    }

    fs::path dir_;
    std::string path_;
};

}  // namespace

TEST_F(ProfileFileTest, ReadsNamesWithoutCaseAndValuesTrimmedAndUnquoted) {
    put("; a comment=1\r\n"
        "top=outside any section\n"
        "[Other]\r\n"
        "Back1a=7\r\n"
        "  [ colours ]  \n"
        "  back1A  =  12345 \t\r\n"
        "Quoted=\"  spaced  \"\n"
        "Single='x'\n"
        "Unmatched=\"x'\n"
        "Bare\n"
        "[Colours]\n"
        "Back2a=only the first section counts\n");
    const ProfileFile file(path_);
    EXPECT_EQ(file.read("Colours", "Back1a"), "12345");
    EXPECT_EQ(file.read("COLOURS", "BACK1A"), "12345");
    EXPECT_EQ(file.read("Colours", "Quoted"), "  spaced  ");
    EXPECT_EQ(file.read("Colours", "Single"), "x");
    EXPECT_EQ(file.read("Colours", "Unmatched"), "\"x'");
    EXPECT_EQ(file.read("Colours", "Bare"), "");
    EXPECT_EQ(file.read("Other", "Back1a"), "7");
    EXPECT_EQ(file.read("Colours", "Back2a"), "");
    EXPECT_EQ(file.read("Colours", "top"), "");
    EXPECT_EQ(file.read("Missing", "Back1a"), "");
    EXPECT_EQ(ProfileFile((dir_ / "absent.ini").string()).read("Colours", "Back1a"), "");
    EXPECT_EQ(ProfileFile("").read("Colours", "Back1a"), "");
}

TEST_F(ProfileFileTest, ReadsAtMost511Bytes) {
    const std::string longValue(600, 'v');
    put("[Colours]\r\nBitmapa=" + longValue + "\r\n");
    EXPECT_EQ(ProfileFile(path_).read("Colours", "Bitmapa"), longValue.substr(0, 511));
}

TEST_F(ProfileFileTest, WritesCrlfLinesCreatingTheFileAndSection) {
    const ProfileFile file(path_);
    ASSERT_TRUE(file.write("Colours", "Back1a", "1252115"));
    EXPECT_EQ(bytes(), "[Colours]\r\nBack1a=1252115\r\n");
    ASSERT_TRUE(file.write("Colours", "Bitmapa", ""));
    EXPECT_EQ(bytes(), "[Colours]\r\nBack1a=1252115\r\nBitmapa=\r\n");
    EXPECT_EQ(file.read("Colours", "Bitmapa"), "");
    EXPECT_FALSE(ProfileFile((dir_ / "no-such-folder" / "x.ini").string()).write("Colours", "Back1a", "1"));
    EXPECT_FALSE(ProfileFile("").write("Colours", "Back1a", "1"));
}

TEST_F(ProfileFileTest, ReplacesOneKeyAndKeepsEveryOtherLine) {
    put("; kept\n[colours]\nBACK1A=1\nMetera=2\n\n[Other]\nBack1a=3\n");
    const ProfileFile file(path_);
    ASSERT_TRUE(file.write("Colours", "Back1a", "4"));
    ASSERT_TRUE(file.write("Colours", "LeftToRighta", "0"));
    ASSERT_TRUE(file.write("Third", "Meterc", "5"));
    EXPECT_EQ(file.read("Colours", "Back1a"), "4");
    EXPECT_EQ(file.read("Colours", "LeftToRighta"), "0");
    EXPECT_EQ(file.read("Colours", "Metera"), "2");
    EXPECT_EQ(file.read("Other", "Back1a"), "3");
    EXPECT_EQ(file.read("Third", "Meterc"), "5");
    // Nothing is left beside the file.
    EXPECT_EQ(std::distance(fs::directory_iterator(dir_), fs::directory_iterator()), 1);
#ifndef _WIN32
    EXPECT_EQ(bytes(), "; kept\r\n[colours]\r\nBACK1A=4\r\nMetera=2\r\nLeftToRighta=0\r\n\r\n[Other]\r\n"
                       "Back1a=3\r\n\r\n[Third]\r\nMeterc=5\r\n");
#endif
}

TEST_F(ProfileFileTest, RefusesWhatWouldBreakTheFile) {
    put("[Colours]\r\nBack1a=1\r\n");
    const ProfileFile file(path_);
    for (const auto& [section, key, value] : {std::tuple<std::string, std::string, std::string>{"Col]ours", "k", "v"},
                                              {"Colours", "Back1a=x", "v"},
                                              {"Colours", ";Back1a", "v"},
                                              {"Colours", "[Back1a", "v"},
                                              {"Colours", "  ", "v"},
                                              {"", "Back1a", "v"},
                                              {"Colours", "Back1a", "2\r\n[Other]"}}) {
        EXPECT_FALSE(file.write(section, key, value)) << section << " " << key;
    }
    EXPECT_EQ(bytes(), "[Colours]\r\nBack1a=1\r\n");
}

// On Windows the file calls are the system's: the portable format must read what they write and the reverse.
TEST_F(ProfileFileTest, PortableFormatAgreesWithTheFileCalls) {
    const ProfileFile file(path_);
    ASSERT_TRUE(file.write("Colours", "Back1b", "99"));
    ASSERT_TRUE(file.write("Other", "Back1b", "1"));
    EXPECT_EQ(ProfileFile::findValue(bytes(), "colours", "BACK1B"), "99");
    put(ProfileFile::withValue(bytes(), "Colours", "Bitmapb", "'pic.bmp'"));
    EXPECT_EQ(file.read("Colours", "Bitmapb"), "pic.bmp");
    EXPECT_EQ(file.read("Colours", "Back1b"), "99");
    EXPECT_EQ(file.read("Other", "Back1b"), "1");
}
