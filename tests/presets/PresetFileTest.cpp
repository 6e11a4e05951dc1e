#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <vector>

#include "filter/ReverbCore.h"
#include "presets/PresetFile.h"

namespace ulvetta {
namespace {

namespace fs = std::filesystem;
using Bytes = std::vector<char>;
using Names = std::vector<std::string>;

Bytes bytesOf(const fs::path& p) {
    std::ifstream in(p, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

void writeBytes(const fs::path& p, const Bytes& b) {
    std::ofstream(p, std::ios::binary).write(b.data(), static_cast<std::streamsize>(b.size()));
}

// A valid record built by hand from the documented layout, independent of the core's saveState.
Bytes handRecord(int32_t diffusion) {
    Bytes r = {88, 0, 0, 0, 0x24, char(0xa5), 0x18, 0x38, 0x15, 0x3f, char(0xd5), 0x11, char(0x9e), char(0xda),
               0x00, 0x10, char(0xb5), 0x07, 0x1e, 0x57};
    r.resize(88, 0);
    r[20] = static_cast<char>(diffusion);
    return r;
}

struct Answer : OverwriteQuestion {
    explicit Answer(bool yes) : yes(yes) {}
    bool confirmOverwrite(const std::string&, const std::string&) override { return ++asked, yes; }
    bool yes;
    int asked = 0;
};

// A fresh folder per test holding the preset folder, so that a file landing beside or above it shows.
class PresetFolderTest : public ::testing::Test {
protected:
    void SetUp() override { fs::create_directories(dir_); }
    void TearDown() override { fs::remove_all(root_); }
    Names entries() const {
        Names names;
        for (const auto& e : fs::recursive_directory_iterator(root_))
            names.push_back(fs::relative(e.path(), root_).generic_string());
        std::sort(names.begin(), names.end());
        return names;
    }
    const fs::path root_ = fs::temp_directory_path() / ("ulvetta-presets-" + std::to_string(std::random_device()()));
    const fs::path dir_ = root_ / "Presets";
    PresetFolder folder_{dir_.string()};
    ReverbCore core_;
};

TEST_F(PresetFolderTest, ListsOnlyRegularFilesHoldingOneValidRecord) {
    const Bytes good = handRecord(40);
    Bytes wrongGuid = good, wrongSize = good, longer = good;
    wrongGuid[10] ^= 1;
    wrongSize[0] = 89;
    longer.push_back(0);
    for (const char* name : {"Plain.stp", "Upper.STP", "Mixed.Stp", "Other.txt", "Plainstp", ".stp", "a:b.stp"})
        writeBytes(dir_ / name, good);
    for (const auto& [name, bytes] : {std::pair{"WrongGuid.stp", wrongGuid}, {"WrongSize.stp", wrongSize},
                                      {"Longer.stp", longer}, {"Empty.stp", Bytes()}, {"Huge.stp", good}})
        writeBytes(dir_ / name, bytes);
    fs::resize_file(dir_ / "Huge.stp", uintmax_t(4) << 30);  // sparse: judged by its size, never read
    fs::create_directory(dir_ / "Folder.stp");
    Names listed = folder_.list();
    std::sort(listed.begin(), listed.end());
    EXPECT_EQ(listed, (Names{"Mixed", "Plain", "Upper"}));
    EXPECT_EQ(folder_.load("Huge", core_), PresetResult::Invalid);
}

// A suffix in any letter case holds the preset for every operation. Where several files hold one name,
// the name is listed once and the first valid one in the order .stp, .stP, ... .STP is the preset.
TEST_F(PresetFolderTest, SuffixCaseIsMatchedAlikeEverywhere) {
    writeBytes(dir_ / "Hall.STP", handRecord(40));
    writeBytes(dir_ / "x.STP", handRecord(41));
    writeBytes(dir_ / "x.stp", Bytes());
    writeBytes(dir_ / "y.Stp", handRecord(42));
    writeBytes(dir_ / "y.stp", handRecord(43));
    writeBytes(dir_ / "z.sTp", Bytes(88, 0));
    Names listed = folder_.list();
    std::sort(listed.begin(), listed.end());
    EXPECT_EQ(listed, (Names{"Hall", "x", "y"}));
    for (const auto& [name, diffusion] : {std::pair{"Hall", 40}, {"x", 41}, {"y", 43}}) {
        ASSERT_EQ(folder_.load(name, core_), PresetResult::Ok) << name;
        EXPECT_EQ(core_.getValue(kDiffusion), diffusion) << name;
    }
    EXPECT_EQ(folder_.pathOf("Hall"), (dir_ / "Hall.STP").string());
    EXPECT_EQ(folder_.pathOf("z"), (dir_ / "z.sTp").string()) << "an invalid file is still the one reported";
    EXPECT_EQ(folder_.load("z", core_), PresetResult::Invalid);

    // Saving asks about the file that holds the name and replaces that one.
    Answer no(false), yes(true);
    core_.setValue(kDiffusion, 77);
    EXPECT_EQ(folder_.save("Hall", core_, no), PresetResult::Declined);
    ASSERT_EQ(folder_.save("Hall", core_, yes), PresetResult::Ok);
    EXPECT_EQ(bytesOf(dir_ / "Hall.STP")[20], 77);
    EXPECT_EQ(no.asked + yes.asked, 2);

    // Deleting a name removes every file of it, valid or not, so it is listed no more.
    for (const char* name : {"Hall", "x", "z"}) EXPECT_EQ(folder_.remove(name), PresetResult::Ok) << name;
    EXPECT_EQ(folder_.list(), Names{"y"});
    EXPECT_EQ(entries(), (Names{"Presets", "Presets/y.Stp", "Presets/y.stp"}));
}

TEST_F(PresetFolderTest, NamesThatLeaveTheFolderOrBreakWindowsAreRefused) {
    writeBytes(root_ / "x.stp", handRecord(40));  // what the escaping names would reach
    Answer yes(true);
    for (const std::string& name : Names{"../x", "..\\..\\x", "..", "a/b", "a:b", "what?", "a|b", "", "tab\tname",
                                         std::string("nul\0byte", 8), "CON", "nul.txt", std::string(65, 'n')}) {
        EXPECT_EQ(folder_.save(name, core_, yes), PresetResult::BadName) << name;
        EXPECT_EQ(folder_.remove(name), PresetResult::BadName) << name;
        EXPECT_EQ(folder_.load(name, core_), PresetResult::BadName) << name;
    }
    EXPECT_EQ(yes.asked, 0);
    EXPECT_EQ(entries(), (Names{"Presets", "x.stp"}));
    for (const std::string& good : Names{"My Hall 2", "a.b", "x.", "Console", "COM0", std::string(64, 'n')})
        EXPECT_EQ(folder_.save(good, core_, yes), PresetResult::Ok) << good;
}

TEST_F(PresetFolderTest, SaveCreatesTheFolderOverwritesOnlyWhenAllowedAndRoundTrips) {
    PresetFolder folder((root_ / "a" / "Presets").string());
    EXPECT_TRUE(folder.list().empty());
    Answer yes(true), no(false);
    ASSERT_EQ(folder.save("Keep", core_, no), PresetResult::Ok);  // nothing to overwrite, nothing asked
    const fs::path file = root_ / "a" / "Presets" / "Keep.stp";
    const Bytes original = bytesOf(file);
    core_.setValue(kAlgorithm, 5);
    for (int32_t id = 0; id < kParamCount; ++id)
        if (id != kAlgorithm) core_.setValue(id, findParam(id)->minimum + 1);  // away from every row
    EXPECT_EQ(folder.save("Keep", core_, no), PresetResult::Declined);
    EXPECT_EQ(bytesOf(file), original);
    ASSERT_EQ(folder.save("Keep", core_, yes), PresetResult::Ok);
    const Bytes changed = bytesOf(file);
    ASSERT_EQ(folder.save("Keep", core_, yes), PresetResult::Ok);
    EXPECT_EQ(bytesOf(file), changed);
    EXPECT_EQ(entries(), (Names{"Presets", "a", "a/Presets", "a/Presets/Keep.stp"}));  // no temporary file
    ReverbCore target;
    ASSERT_EQ(folder.load("Keep", target), PresetResult::Ok);
    for (int32_t id = 0; id < kParamCount; ++id) EXPECT_EQ(target.getValue(id), core_.getValue(id)) << id;
    EXPECT_EQ(PresetFolder((root_ / "missing").string(), false).save("x", core_, no), PresetResult::IoError);
    EXPECT_FALSE(fs::exists(root_ / "missing"));
}

TEST_F(PresetFolderTest, LoadRefusesWhatIsNotARecordAndDeleteToleratesMissingFiles) {
    Bytes wrong = handRecord(40);
    wrong[19] ^= 0x10;
    writeBytes(dir_ / "Wrong.stp", wrong);
    EXPECT_EQ(folder_.load("Wrong", core_), PresetResult::Invalid);
    EXPECT_EQ(folder_.load("Absent", core_), PresetResult::NotFound);
    EXPECT_EQ(core_.getValue(kDiffusion), 100);
    writeBytes(dir_ / "Right.stp", handRecord(40));
    EXPECT_EQ(folder_.load("Right", core_), PresetResult::Ok);
    EXPECT_EQ(core_.getValue(kDiffusion), 40);
    fs::create_directory(dir_ / "Dir.stp");
    EXPECT_EQ(folder_.remove("Right"), PresetResult::Ok);
    EXPECT_EQ(folder_.remove("Right"), PresetResult::Ok);  // nothing left to delete
    EXPECT_EQ(folder_.remove("Dir"), PresetResult::IoError);
    EXPECT_EQ(entries(), (Names{"Presets", "Presets/Dir.stp", "Presets/Wrong.stp"}));
}

}  // namespace
}  // namespace ulvetta
