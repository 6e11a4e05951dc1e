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
using Names = std::vector<std::string>;

// A fresh folder per test; the preset folder is a child of it, so that a file landing beside or above
// the folder shows.
class PresetFolderTest : public ::testing::Test {
protected:
    void SetUp() override {
        std::random_device rd;
        root_ = fs::temp_directory_path() / ("ulvetta-presets-" + std::to_string(rd()) + std::to_string(rd()));
        dir_ = root_ / "Presets";
        fs::create_directories(dir_);
    }
    void TearDown() override {
        std::error_code ec;
        fs::remove_all(root_, ec);
    }
    static std::vector<char> bytesOf(const fs::path& p) {
        std::ifstream in(p, std::ios::binary);
        return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    }
    static void writeBytes(const fs::path& p, const std::vector<char>& bytes) {
        std::ofstream(p, std::ios::binary).write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    }
    Names entries() const {
        Names names;
        for (const auto& e : fs::recursive_directory_iterator(root_))
            names.push_back(fs::relative(e.path(), root_).generic_string());
        std::sort(names.begin(), names.end());
        return names;
    }
    fs::path root_, dir_;
};

struct Answer : OverwriteQuestion {
    explicit Answer(bool yes) : yes(yes) {}
    bool confirmOverwrite(const std::string&, const std::string&) override { return ++asked, yes; }
    bool yes;
    int asked = 0;
};

// A valid record built by hand from the documented layout, independent of the core's saveState.
std::vector<char> handRecord(int32_t diffusion) {
    std::vector<char> r = {88, 0, 0, 0, 0x24, char(0xa5), 0x18, 0x38, 0x15, 0x3f, char(0xd5), 0x11,
                           char(0x9e), char(0xda), 0x00, 0x10, char(0xb5), 0x07, 0x1e, 0x57};
    r.resize(88, 0);
    r[20] = static_cast<char>(diffusion);
    return r;
}

TEST_F(PresetFolderTest, ListsOnlyRegularFilesHoldingOneValidRecord) {
    const std::vector<char> good = handRecord(40);
    for (const char* name : {"Plain.stp", "Upper.STP", "Mixed.Stp", "Other.txt", "Plainstp", ".stp", "a:b.stp"})
        writeBytes(dir_ / name, good);
    fs::create_directory(dir_ / "Folder.stp");
    std::vector<char> wrongGuid = good, wrongSize = good, longer = good;
    wrongGuid[10] ^= 1;
    wrongSize[0] = 89;
    longer.push_back(0);
    writeBytes(dir_ / "WrongGuid.stp", wrongGuid);
    writeBytes(dir_ / "WrongSizeField.stp", wrongSize);
    writeBytes(dir_ / "OneByteMore.stp", longer);
    writeBytes(dir_ / "Empty.stp", {});
    writeBytes(dir_ / "Huge.stp", good);
    fs::resize_file(dir_ / "Huge.stp", uintmax_t(4) << 30);  // sparse: skipped by its size, never read
    Names listed = PresetFolder(dir_.string()).list();
    std::sort(listed.begin(), listed.end());
    EXPECT_EQ(listed, (Names{"Mixed", "Plain", "Upper"}));
    ReverbCore core;
    EXPECT_EQ(PresetFolder(dir_.string()).load("Huge", core), PresetResult::Invalid);
}

TEST_F(PresetFolderTest, MissingFolderListsNothingAndIsCreatedByTheFirstSave) {
    PresetFolder folder((root_ / "a" / "b" / "Presets").string());
    EXPECT_TRUE(folder.list().empty());
    ReverbCore core;
    Answer no(false);
    ASSERT_EQ(folder.save("First", core, no), PresetResult::Ok);
    EXPECT_EQ(folder.list(), Names{"First"});
    PresetFolder fixed((root_ / "missing").string(), false);
    EXPECT_EQ(fixed.save("First", core, no), PresetResult::IoError);
    EXPECT_FALSE(fs::exists(root_ / "missing"));
}

TEST_F(PresetFolderTest, NamesThatLeaveTheFolderOrBreakWindowsAreRefused) {
    writeBytes(root_ / "x.stp", handRecord(40));  // what the escaping names would reach
    PresetFolder folder(dir_.string());
    ReverbCore core;
    Answer yes(true);
    for (const std::string& name : Names{"../x", "..\\..\\x", "..", "a/b", "a:b", "what?", "a|b", "", "tab\tname",
                                         std::string("nul\0byte", 8), "CON", "nul.txt", std::string(65, 'n')}) {
        SCOPED_TRACE(name);
        EXPECT_FALSE(presetNameProblem(name).empty());
        EXPECT_EQ(folder.save(name, core, yes), PresetResult::BadName);
        EXPECT_EQ(folder.remove(name), PresetResult::BadName);
        EXPECT_EQ(folder.load(name, core), PresetResult::BadName);
    }
    EXPECT_EQ(yes.asked, 0);
    EXPECT_EQ(entries(), (Names{"Presets", "x.stp"}));
    for (const std::string& good : Names{"My Hall 2", "a.b", "x.", "Console", "COM0", std::string(64, 'n')})
        EXPECT_EQ(folder.save(good, core, yes), PresetResult::Ok) << good;
}

TEST_F(PresetFolderTest, OverwriteOnlyWhenAllowedAndSavingTwiceGivesIdenticalFiles) {
    PresetFolder folder(dir_.string());
    ReverbCore core;
    Answer yes(true), no(false);
    ASSERT_EQ(folder.save("Keep", core, yes), PresetResult::Ok);
    const std::vector<char> original = bytesOf(dir_ / "Keep.stp");
    core.setValue(kDecay, 90);
    EXPECT_EQ(folder.save("Keep", core, no), PresetResult::Declined);
    EXPECT_EQ(bytesOf(dir_ / "Keep.stp"), original);
    ASSERT_EQ(folder.save("Keep", core, yes), PresetResult::Ok);
    const std::vector<char> changed = bytesOf(dir_ / "Keep.stp");
    EXPECT_NE(changed, original);
    ASSERT_EQ(folder.save("Keep", core, yes), PresetResult::Ok);
    EXPECT_EQ(bytesOf(dir_ / "Keep.stp"), changed);
    EXPECT_EQ(entries(), (Names{"Presets", "Presets/Keep.stp"}));  // no temporary file left
}

TEST_F(PresetFolderTest, SaveAndLoadRoundTripAllSeventeenValues) {
    PresetFolder folder(dir_.string());
    ReverbCore source;
    source.setValue(kAlgorithm, 5);
    for (int32_t id = 0; id < kParamCount; ++id)
        if (id != kAlgorithm) source.setValue(id, findParam(id)->minimum + 1);  // away from every row
    Answer yes(true);
    ASSERT_EQ(folder.save("Round", source, yes), PresetResult::Ok);
    ReverbCore target;
    ASSERT_EQ(folder.load("Round", target), PresetResult::Ok);
    for (int32_t id = 0; id < kParamCount; ++id) EXPECT_EQ(target.getValue(id), source.getValue(id)) << "id " << id;
}

TEST_F(PresetFolderTest, LoadRefusesWhatIsNotARecordAndDeleteToleratesMissingFiles) {
    PresetFolder folder(dir_.string());
    std::vector<char> wrong = handRecord(40);
    wrong[19] ^= 0x10;
    writeBytes(dir_ / "Wrong.stp", wrong);
    ReverbCore core;
    EXPECT_EQ(folder.load("Wrong", core), PresetResult::Invalid);
    EXPECT_EQ(folder.load("Absent", core), PresetResult::NotFound);
    EXPECT_EQ(core.getValue(kDiffusion), 100);
    writeBytes(dir_ / "Right.stp", handRecord(40));
    EXPECT_EQ(folder.load("Right", core), PresetResult::Ok);
    EXPECT_EQ(core.getValue(kDiffusion), 40);
    StateBytes bytes;
    EXPECT_EQ(readStateFile(dir_.string(), bytes), PresetResult::IoError);
    writeBytes(dir_ / "Gone.stp", handRecord(1));
    fs::create_directory(dir_ / "Dir.stp");
    EXPECT_EQ(folder.remove("Gone"), PresetResult::Ok);
    EXPECT_EQ(folder.remove("Gone"), PresetResult::Ok);  // nothing left to delete
    EXPECT_EQ(folder.remove("Dir"), PresetResult::IoError);
    EXPECT_EQ(entries(), (Names{"Presets", "Presets/Dir.stp", "Presets/Right.stp", "Presets/Wrong.stp"}));
}

}  // namespace
}  // namespace ulvetta
