#include <nlohmann/json.hpp>

#include "CliHarness.h"

namespace ulvetta::testing {
namespace {

using nlohmann::json;

class ParamsTest : public CliTest {
protected:
    // Runs "params --json" with args and returns the parsed array (empty on failure).
    json params(std::vector<std::string> args) {
        args.insert(args.begin(), "params");
        args.push_back("--json");
        const RunResult r = run(args);
        EXPECT_EQ(r.status, 0) << r.err;
        if (r.status != 0) return json::array();
        return json::parse(r.out);
    }
    int32_t value(const std::vector<std::string>& args, int id) {
        const json j = params(args);
        return j.size() == 17 ? j[id]["value"].get<int32_t>() : INT32_MIN;
    }
};

TEST_F(ParamsTest, JsonHasSeventeenEntriesWithEveryKey) {
    const json j = params({});
    ASSERT_TRUE(j.is_array());
    ASSERT_EQ(j.size(), 17u);
    const std::vector<std::string> keys = {"id",     "name",   "value",   "text",    "fullText", "minimum",
                                           "maximum", "minText", "maxText", "default", "position"};
    for (int id = 0; id < 17; ++id) {
        const json& e = j[id];
        ASSERT_EQ(e.size(), keys.size());
        for (const std::string& k : keys) ASSERT_TRUE(e.contains(k)) << k;
        EXPECT_EQ(e["id"], id);
        EXPECT_GE(e["position"].get<double>(), 0.0);
        EXPECT_LE(e["position"].get<double>(), 1.0);
        EXPECT_GE(e["value"].get<int>(), e["minimum"].get<int>());
        EXPECT_LE(e["value"].get<int>(), e["maximum"].get<int>());
    }
    EXPECT_EQ(j[1]["name"], "Pre Delay");
    EXPECT_EQ(j[1]["value"], 32);
    EXPECT_EQ(j[6]["fullText"], "-18");
    EXPECT_EQ(j[6]["minText"], "-Inf.");
    EXPECT_EQ(j[6]["maxText"], "6");
    EXPECT_EQ(j[10]["text"], "Off");
    EXPECT_EQ(j[11]["minText"], "Off");
    EXPECT_EQ(j[14]["name"], "Notch Q");
    EXPECT_EQ(j[15]["name"], "Algorithm");
    EXPECT_EQ(j[16]["name"], "Meter Source");
    EXPECT_DOUBLE_EQ(j[7]["position"].get<double>(), 600.0 / 660.0);

    const RunResult table = run({"params"});
    ASSERT_EQ(table.status, 0);
    EXPECT_EQ(std::count(table.out.begin(), table.out.end(), '\n'), 18) << "a header and 17 rows";
    EXPECT_NE(table.out.find("Early Reflections"), std::string::npos);
}

TEST_F(ParamsTest, EditsApplyInCommandLineOrder) {
    EXPECT_EQ(value({"--set", "Pre Delay=40", "--set-raw", "1=50"}, 1), 50);
    EXPECT_EQ(value({"--set-raw", "1=50", "--set", "Pre Delay=40"}, 1), 40);
    EXPECT_EQ(value({"--set", "Pre Delay=40", "--set", "pre delay = 41"}, 1), 41);
    EXPECT_EQ(value({"--set=Pre Delay=40", "--set-raw=Pre Delay=60"}, 1), 60);
    // Switching algorithm loads that algorithm's remembered row: an edit before it is replaced, one
    // after it stays.
    EXPECT_EQ(value({"--set", "Decay=12", "--set", "Algorithm=large room"}, 2), 81);
    EXPECT_EQ(value({"--set", "Algorithm=4", "--set", "Decay=12"}, 2), 12);
    EXPECT_EQ(value({"--set-raw", "15=4", "--set", "Decay=12"}, 15), 4);
}

TEST_F(ParamsTest, TypedValuesUseTheEditorUnits) {
    EXPECT_EQ(value({"--set", "Output Level Wet=-12.5"}, 6), -125);
    EXPECT_EQ(value({"--set", "Output Level Wet=-17.3"}, 6), -173);
    EXPECT_EQ(value({"--set", "Notch Q=0.7"}, 14), 7);
    EXPECT_EQ(value({"--set", "Input Gain=-7"}, 9), -70);
    EXPECT_EQ(value({"--set", "Early Reflections=-inf."}, 5), -600);
    EXPECT_EQ(value({"--set", "Output Level Dry=-Inf"}, 7), -600);
    EXPECT_EQ(value({"--set", "Low Pass Freq=Off"}, 10), 10000);
    EXPECT_EQ(value({"--set", "High Pass Freq=off"}, 11), 100);
    EXPECT_EQ(value({"--set", "Pre Delay=4000"}, 1), 500) << "out of range clamps as in the editor";
    EXPECT_EQ(value({"--set", "Meter Source=wet"}, 16), 2);
    EXPECT_EQ(value({"--set", "meter source=0"}, 16), 0);
}

TEST_F(ParamsTest, FactoryPresetsByNameAndStateFiles) {
    for (const char* name : {"large room", "LARGE ROOM *****", "Large Room"}) {
        SCOPED_TRACE(name);
        const json j = params({"--preset", name});
        ASSERT_EQ(j.size(), 17u);
        EXPECT_EQ(j[15]["value"], 4);
        EXPECT_EQ(j[2]["value"], 81);
        EXPECT_EQ(j[4]["value"], 100);
    }
    EXPECT_EQ(value({"--algorithm", "7"}, 3), 99) << "Damping 140 of the row clamps";

    // The state file is loaded after the algorithm: its values win, and edits after it win again.
    ASSERT_EQ(run({"presets", "--dir", "P", "save", "s", "--algorithm", "5", "--set", "Decay=33"}).status, 0);
    const std::vector<std::string> state = {"--algorithm", "1", "--state", "P/s.stp"};
    EXPECT_EQ(value(state, 15), 5);
    EXPECT_EQ(value(state, 2), 33);
    std::vector<std::string> edited = state;
    edited.insert(edited.end(), {"--set", "Decay=44"});
    EXPECT_EQ(value(edited, 2), 44);
}

TEST_F(CliTest, PresetCommandsManageTheFolder) {
    const std::vector<std::string> dir = {"--dir", "Presets"};
    auto cmd = [&](std::vector<std::string> args) {
        args.insert(args.begin(), "presets");
        args.insert(args.end(), dir.begin(), dir.end());
        return run(args);
    };
    RunResult r = cmd({"list"});
    EXPECT_EQ(r.status, 0);
    EXPECT_EQ(r.out, "");
    EXPECT_FALSE(fs::exists(dir_ / "Presets")) << "listing does not create the folder";

    ASSERT_EQ(cmd({"save", "Hall A", "--preset", "bright hall", "--set", "Pre Delay=40"}).status, 0);
    ASSERT_EQ(cmd({"save", "Plate", "--algorithm", "0"}).status, 0);
    r = cmd({"list"});
    EXPECT_EQ(r.out, "Hall A\nPlate\n");

    r = cmd({"show", "Hall A"});
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_NE(r.out.find("Pre Delay: 40\n"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("Algorithm: BRIGHT HALL **** (5)\n"), std::string::npos) << r.out;
    EXPECT_EQ(std::count(r.out.begin(), r.out.end(), '\n'), 17);

    // Without --force and without a terminal to ask on, an existing preset is kept byte for byte.
    const std::string before = slurp(dir_ / "Presets" / "Hall A.stp");
    expectOneSentence(cmd({"save", "Hall A", "--algorithm", "3"}), 2);
    EXPECT_EQ(slurp(dir_ / "Presets" / "Hall A.stp"), before);
    ASSERT_EQ(cmd({"save", "Hall A", "--algorithm", "3", "--force"}).status, 0);
    EXPECT_NE(slurp(dir_ / "Presets" / "Hall A.stp"), before);

    ASSERT_EQ(cmd({"delete", "Plate"}).status, 0);
    EXPECT_EQ(cmd({"list"}).out, "Hall A\n");
    expectOneSentence(cmd({"delete", "Plate"}), 2);
    expectOneSentence(cmd({"show", "Plate"}), 2);

    for (const char* bad : {"../x", "..\\..\\x", "a:b", "what?", "st*r"}) {
        SCOPED_TRACE(bad);
        expectOneSentence(cmd({"save", bad}), 2);
        expectOneSentence(cmd({"delete", bad}), 2);
    }
    EXPECT_EQ(listing(), (std::vector<std::string>{"Presets"}));
    std::vector<std::string> files;
    for (const auto& e : fs::directory_iterator(dir_ / "Presets")) files.push_back(e.path().filename().string());
    EXPECT_EQ(files, (std::vector<std::string>{"Hall A.stp"}));
}

TEST_F(CliTest, DefaultPresetFolderFollowsXdgDataHome) {
    RunResult r = run({"presets", "save", "Mine"}, "XDG_DATA_HOME=" + shellQuote((dir_ / "data").string()));
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_TRUE(fs::is_regular_file(dir_ / "data" / "ulvetta" / "Presets" / "Mine.stp"));
    r = run({"presets", "list"}, "XDG_DATA_HOME= HOME=" + shellQuote((dir_ / "home").string()));
    EXPECT_EQ(r.out, "");
    r = run({"presets", "save", "Mine"}, "XDG_DATA_HOME= HOME=" + shellQuote((dir_ / "home").string()));
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_TRUE(fs::is_regular_file(dir_ / "home" / ".local" / "share" / "ulvetta" / "Presets" / "Mine.stp"));
}

TEST_F(CliTest, UsageMistakesExitTwoWithOneSentence) {
    expectOneSentence(run({}), 2);
    expectOneSentence(run({"mix"}), 2);
    expectOneSentence(run({"presets"}), 2);
    expectOneSentence(run({"params", "--algorithm", "1", "--preset", "large room"}), 2);
    expectOneSentence(run({"params", "--set", "Bogus=1"}), 2);
    const RunResult help = run({"--help"});
    EXPECT_EQ(help.status, 0);
    EXPECT_NE(help.out.find("render"), std::string::npos);
}

}  // namespace
}  // namespace ulvetta::testing
