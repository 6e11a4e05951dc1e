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

// A fresh, empty folder per test, removed afterwards; the preset folder is a child of it so that tests
// can see whether anything landed beside or above the folder.
class PresetFolderTest : public ::testing::Test {
protected:
    void SetUp() override {
        std::random_device rd;
        root_ = fs::temp_directory_path() / ("ulvetta-presets-" + std::to_string(rd()) + std::to_string(rd()));
        fs::create_directories(root_ / "Presets");
        dir_ = root_ / "Presets";
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
        std::ofstream out(p, std::ios::binary | std::ios::trunc);
        out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
    }
    static std::vector<std::string> sorted(std::vector<std::string> v) {
        std::sort(v.begin(), v.end());
        return v;
    }
    std::vector<std::string> entries() const {
        std::vector<std::string> names;
        for (const auto& e : fs::recursive_directory_iterator(root_))
            names.push_back(fs::relative(e.path(), root_).generic_string());
        return sorted(names);
    }

    fs::path root_;
    fs::path dir_;
};

struct Answer : OverwriteQuestion {
    explicit Answer(bool yes) : yes(yes) {}
    bool confirmOverwrite(const std::string& name, const std::string& path) override {
        ++asked;
        lastName = name;
        lastPath = path;
        return yes;
    }
    bool yes;
    int asked = 0;
    std::string lastName, lastPath;
};

// A valid record built by hand from the documented layout, independent of the core's saveState.
std::vector<char> handRecord(int32_t diffusion) {
    std::vector<char> r(88, 0);
    const uint8_t head[20] = {88,   0,    0,    0,    0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f,
                              0xd5, 0x11, 0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57};
    std::copy(std::begin(head), std::end(head), r.begin());
    r[20] = static_cast<char>(diffusion);
    return r;
}

TEST_F(PresetFolderTest, ListsOnlyRegularFilesHoldingOneValidRecord) {
    const std::vector<char> good = handRecord(40);
    writeBytes(dir_ / "Plain.stp", good);
    writeBytes(dir_ / "Upper.STP", good);
    writeBytes(dir_ / "Mixed.Stp", good);
    fs::create_directory(dir_ / "Folder.stp");
    std::vector<char> wrongGuid = good;
    wrongGuid[10] ^= 1;
    writeBytes(dir_ / "WrongGuid.stp", wrongGuid);
    std::vector<char> wrongSizeField = good;
    wrongSizeField[0] = 89;
    writeBytes(dir_ / "WrongSizeField.stp", wrongSizeField);
    std::vector<char> longer = good;
    longer.push_back(0);
    writeBytes(dir_ / "OneByteMore.stp", longer);
    writeBytes(dir_ / "OneByteLess.stp", std::vector<char>(good.begin(), good.end() - 1));
    writeBytes(dir_ / "Empty.stp", {});
    writeBytes(dir_ / "Other.txt", good);
    writeBytes(dir_ / "Plainstp", good);
    writeBytes(dir_ / ".stp", good);
    // A name that could not be saved or loaded here is not offered either.
    writeBytes(dir_ / "a:b.stp", good);

    EXPECT_EQ(sorted(PresetFolder(dir_.string()).list()), (std::vector<std::string>{"Mixed", "Plain", "Upper"}));
}

TEST_F(PresetFolderTest, HugeFileIsSkippedWithoutBeingRead) {
    // A sparse 4 GiB file that starts with a valid record: reading it whole would take the memory and
    // time of its size; judging it by its size skips it at once.
    writeBytes(dir_ / "Huge.stp", handRecord(40));
    fs::resize_file(dir_ / "Huge.stp", uintmax_t(4) << 30);
    writeBytes(dir_ / "Small.stp", handRecord(40));
    EXPECT_EQ(PresetFolder(dir_.string()).list(), (std::vector<std::string>{"Small"}));

    StateBytes bytes;
    EXPECT_EQ(readStateFile((dir_ / "Huge.stp").string(), bytes), PresetResult::Invalid);
    ReverbCore core;
    EXPECT_EQ(PresetFolder(dir_.string()).load("Huge", core), PresetResult::Invalid);
}

TEST_F(PresetFolderTest, MissingFolderListsNothingAndIsCreatedByTheFirstSave) {
    const fs::path nested = root_ / "a" / "b" / "Presets";
    PresetFolder folder(nested.string());
    EXPECT_TRUE(folder.list().empty());
    ReverbCore core;
    Answer no(false);
    ASSERT_EQ(folder.save("First", core, no), PresetResult::Ok);
    EXPECT_EQ(no.asked, 0);
    EXPECT_EQ(folder.list(), (std::vector<std::string>{"First"}));

    PresetFolder fixed((root_ / "missing").string(), false);
    EXPECT_EQ(fixed.save("First", core, no), PresetResult::IoError);
    EXPECT_FALSE(fs::exists(root_ / "missing"));
}

TEST_F(PresetFolderTest, NamesThatLeaveTheFolderOrBreakWindowsAreRefused) {
    // A file the escaping names would reach, to prove that delete leaves it alone.
    writeBytes(root_ / "x.stp", handRecord(40));
    const std::vector<char> before = bytesOf(root_ / "x.stp");
    PresetFolder folder(dir_.string());
    ReverbCore core;
    Answer yes(true);
    const std::vector<std::string> bad = {"../x", "..\\..\\x", "..", "a/b",   "a\\b", "a:b", "what?", "star*",
                                          "a<b",  "a>b",       "a|b", "a\"b", "",     "tab\tname",
                                          std::string("nul\0byte", 8),  "CON",  "nul.txt", "Com1",
                                          std::string(65, 'n')};
    for (const std::string& name : bad) {
        SCOPED_TRACE(name);
        EXPECT_FALSE(presetNameProblem(name).empty());
        EXPECT_EQ(folder.save(name, core, yes), PresetResult::BadName);
        EXPECT_EQ(folder.remove(name), PresetResult::BadName);
        EXPECT_EQ(folder.load(name, core), PresetResult::BadName);
    }
    EXPECT_EQ(yes.asked, 0);
    EXPECT_EQ(bytesOf(root_ / "x.stp"), before);
    EXPECT_EQ(entries(), (std::vector<std::string>{"Presets", "x.stp"}));

    EXPECT_NE(presetNameProblem("../x").find(".."), std::string::npos);
    EXPECT_NE(presetNameProblem("a:b").find("':'"), std::string::npos);
    EXPECT_EQ(presetNameProblem("tab\tname").find('\t'), std::string::npos);

    for (const std::string& good :
         std::vector<std::string>{"My Hall 2", "a.b", "x.", "Console", "COM0", std::string(64, 'n')}) {
        SCOPED_TRACE(good);
        EXPECT_EQ(presetNameProblem(good), "");
        EXPECT_EQ(folder.save(good, core, yes), PresetResult::Ok);
    }
}

TEST_F(PresetFolderTest, AnsweringNoLeavesTheOldFileUnchanged) {
    PresetFolder folder(dir_.string());
    ReverbCore core;
    Answer yes(true), no(false);
    ASSERT_EQ(folder.save("Keep", core, yes), PresetResult::Ok);
    const fs::path file = dir_ / "Keep.stp";
    const std::vector<char> original = bytesOf(file);

    core.setValue(kDecay, 90);
    EXPECT_EQ(folder.save("Keep", core, no), PresetResult::Declined);
    EXPECT_EQ(no.asked, 1);
    EXPECT_EQ(no.lastName, "Keep");
    EXPECT_EQ(fs::path(no.lastPath), file);
    EXPECT_EQ(bytesOf(file), original);

    EXPECT_EQ(folder.save("Keep", core, yes), PresetResult::Ok);
    EXPECT_NE(bytesOf(file), original);
    // Nothing but the preset itself remains in the folder: no temporary file.
    EXPECT_EQ(entries(), (std::vector<std::string>{"Presets", "Presets/Keep.stp"}));
}

TEST_F(PresetFolderTest, SavingTwiceGivesIdenticalFiles) {
    PresetFolder folder(dir_.string());
    ReverbCore core;
    core.setValue(kAlgorithm, 6);
    core.setValue(kNotchQ, 7);
    Answer yes(true);
    ASSERT_EQ(folder.save("Twice", core, yes), PresetResult::Ok);
    const std::vector<char> first = bytesOf(dir_ / "Twice.stp");
    ASSERT_EQ(folder.save("Twice", core, yes), PresetResult::Ok);
    EXPECT_EQ(yes.asked, 1);
    EXPECT_EQ(bytesOf(dir_ / "Twice.stp"), first);
    EXPECT_EQ(first.size(), 88u);
}

TEST_F(PresetFolderTest, SaveAndLoadRoundTripAllSeventeenValues) {
    PresetFolder folder(dir_.string());
    ReverbCore source;
    source.setValue(kAlgorithm, 5);
    // Every value away from its default and from the algorithm-5 memory row.
    const std::vector<std::pair<int32_t, int32_t>> values = {
        {kDiffusion, 61},      {kPreDelay, 123},       {kDecay, 12},           {kDamping, 98},
        {kRoomSize, 177},      {kEarlyReflections, -599}, {kOutputLevelWet, 55}, {kOutputLevelDry, -600},
        {kColour, 2},          {kInputGain, -299},     {kLowPassFreq, 21},     {kHighPassFreq, 15999},
        {kNotchFreq, 21},      {kNotchGain, -119},     {kNotchQ, 49},          {kMeterSource, 0}};
    for (const auto& [id, v] : values) source.setValue(id, v);
    Answer yes(true);
    ASSERT_EQ(folder.save("Round", source, yes), PresetResult::Ok);

    // The file is the record at the documented offsets: Notch Q at 68, Notch Freq at 76.
    const std::vector<char> file = bytesOf(dir_ / "Round.stp");
    ASSERT_EQ(file.size(), 88u);
    auto at = [&](size_t offset) {
        return static_cast<int32_t>(static_cast<uint8_t>(file[offset]) | (static_cast<uint8_t>(file[offset + 1]) << 8) |
                                    (static_cast<uint8_t>(file[offset + 2]) << 16) |
                                    (static_cast<uint32_t>(static_cast<uint8_t>(file[offset + 3])) << 24));
    };
    EXPECT_EQ(at(0), 88);
    EXPECT_EQ(at(24), 123);
    EXPECT_EQ(at(48), -600);
    EXPECT_EQ(at(68), 49);
    EXPECT_EQ(at(72), -119);
    EXPECT_EQ(at(76), 21);
    EXPECT_EQ(at(80), 5);
    EXPECT_EQ(at(84), 0);

    ReverbCore target;
    ASSERT_EQ(folder.load("Round", target), PresetResult::Ok);
    for (int32_t id = 0; id < kParamCount; ++id) EXPECT_EQ(target.getValue(id), source.getValue(id)) << "id " << id;
    EXPECT_EQ(target.getValue(kAlgorithm), 5);
}

TEST_F(PresetFolderTest, InvalidOrMissingPresetChangesNothing) {
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
}

TEST_F(PresetFolderTest, DeleteRemovesOnlyThePresetFile) {
    PresetFolder folder(dir_.string());
    writeBytes(dir_ / "Gone.stp", handRecord(1));
    writeBytes(dir_ / "Stays.stp", handRecord(2));
    fs::create_directory(dir_ / "Dir.stp");
    EXPECT_EQ(folder.remove("Gone"), PresetResult::Ok);
    EXPECT_EQ(folder.remove("Gone"), PresetResult::NotFound);
    EXPECT_EQ(folder.remove("Dir"), PresetResult::NotFound);
    EXPECT_EQ(entries(), (std::vector<std::string>{"Presets", "Presets/Dir.stp", "Presets/Stays.stp"}));
}

TEST_F(PresetFolderTest, StateFileReadingReportsWhatIsWrong) {
    StateBytes bytes;
    writeBytes(root_ / "ok.stp", handRecord(7));
    EXPECT_EQ(readStateFile((root_ / "ok.stp").string(), bytes), PresetResult::Ok);
    EXPECT_EQ(bytes[20], 7);
    EXPECT_EQ(readStateFile((root_ / "none.stp").string(), bytes), PresetResult::NotFound);
    EXPECT_EQ(readStateFile(dir_.string(), bytes), PresetResult::IoError);
    writeBytes(root_ / "text.stp", std::vector<char>(88, 'a'));
    EXPECT_EQ(readStateFile((root_ / "text.stp").string(), bytes), PresetResult::Invalid);
}

}  // namespace
}  // namespace ulvetta
