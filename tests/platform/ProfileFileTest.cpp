// The same cases run against the portable reader and writer on Linux and the system's profile calls on
// Windows, so they also show that a file written by one reads the same on the other.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>

#include "platform/ProfileFile.h"

using namespace ulvetta;
namespace fs = std::filesystem;

struct ProfileFileTest : ::testing::Test {
    ProfileFileTest() { fs::create_directories(dir); }
    ~ProfileFileTest() override { fs::remove_all(dir); }
    void put(const std::string& bytes) { std::ofstream(file.path(), std::ios::binary) << bytes; }
    std::string bytes() const {
        std::ifstream in(file.path(), std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), {});
    }

    const fs::path dir = fs::temp_directory_path() / ("ulvetta-profile-" + std::to_string(std::random_device()()));
    const ProfileFile file{(dir / "Ulvetta.ini").string()};
};

TEST_F(ProfileFileTest, ReadsNamesWithoutCaseAndValuesTrimmedUnquotedAndCut) {
    put("top=outside any section\n[Other]\r\nBack1a=7\r\n  [ colours ]  \n; Back2a=comment\n"
        "  back1A  =  12345 \t\r\nQuoted=\"  spaced  \"\nSingle='x'\nUnmatched=\"x'\nLong=" + std::string(600, 'v') +
        "\n[Colours]\nBack2a=only the first section counts\n");
    const std::pair<const char*, std::string> cases[] = {
        {"BACK1A", "12345"}, {"Quoted", "  spaced  "}, {"Single", "x"}, {"Unmatched", "\"x'"},
        {"Long", std::string(511, 'v')}, {"Back2a", ""}, {"top", ""}};
    for (const auto& [key, value] : cases) EXPECT_EQ(file.read("COLOURS", key), value) << key;
    EXPECT_EQ(file.read("Other", "Back1a"), "7");
    EXPECT_EQ(file.read("Missing", "Back1a"), "");
    EXPECT_EQ(ProfileFile((dir / "absent.ini").string()).read("Colours", "Back1a"), "");
    EXPECT_EQ(ProfileFile("").read("Colours", "Back1a"), "");
}

TEST_F(ProfileFileTest, WritesCrlfLinesReplacingOneKeyAndKeepingTheRest) {
    ASSERT_TRUE(file.write("Colours", "Back1a", "1252115"));
    EXPECT_EQ(bytes(), "[Colours]\r\nBack1a=1252115\r\n");
    put("; kept\n[colours]\nBACK1A=1\nMetera=2\n\n[Other]\nBack1a=3\n");
    ASSERT_TRUE(file.write("Colours", "Back1a", "4"));
    ASSERT_TRUE(file.write("Colours", "LeftToRighta", ""));
    ASSERT_TRUE(file.write("Third", "Meterc", "5"));
    const std::pair<const char*, const char*> cases[] = {
        {"Back1a", "4"}, {"LeftToRighta", ""}, {"Metera", "2"}};
    for (const auto& [key, value] : cases) EXPECT_EQ(file.read("Colours", key), value) << key;
    EXPECT_EQ(file.read("Other", "Back1a"), "3");
    EXPECT_EQ(file.read("Third", "Meterc"), "5");
    EXPECT_EQ(std::distance(fs::directory_iterator(dir), fs::directory_iterator()), 1);  // nothing left beside
#ifndef _WIN32
    EXPECT_EQ(bytes(), "; kept\r\n[colours]\r\nBACK1A=4\r\nMetera=2\r\nLeftToRighta=\r\n\r\n[Other]\r\n"
                       "Back1a=3\r\n\r\n[Third]\r\nMeterc=5\r\n");
#endif
    EXPECT_FALSE(ProfileFile((dir / "no-folder" / "x.ini").string()).write("Colours", "Back1a", "1"));
    EXPECT_FALSE(ProfileFile("").write("Colours", "Back1a", "1"));
    const std::string before = bytes();  // nothing that would break the file's lines is written
    const char* refused[][3] = {{"Col]ours", "k", "v"}, {"Colours", "Back1a=x", "v"}, {"Colours", ";Back1a", "v"},
                                {"Colours", "  ", "v"}, {"Colours", "Back1a", "2\r\n[Other]"}};
    for (const auto& r : refused) EXPECT_FALSE(file.write(r[0], r[1], r[2])) << r[0] << " " << r[1];
    EXPECT_EQ(bytes(), before);
}

// On Windows the file calls are the system's: the portable format must read what they write and the reverse.
TEST_F(ProfileFileTest, PortableFormatAgreesWithTheFileCalls) {
    ASSERT_TRUE(file.write("Colours", "Back1b", "99"));
    ASSERT_TRUE(file.write("Other", "Back1b", "1"));
    EXPECT_EQ(ProfileFile::findValue(bytes(), "colours", "BACK1B"), "99");
    put(ProfileFile::withValue(bytes(), "Colours", "Bitmapb", "'pic.bmp'"));
    EXPECT_EQ(file.read("Colours", "Bitmapb"), "pic.bmp");
    EXPECT_EQ(file.read("Other", "Back1b"), "1");
}
