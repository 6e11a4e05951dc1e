#include <nlohmann/json.hpp>

#include "CliHarness.h"

namespace ulvetta::testing {
namespace {

using nlohmann::json;

TEST_F(CliTest, ParamsJsonHasSeventeenEntriesWithEveryKey) {
    const json j = json::parse(run({"params", "--json"}).out);
    ASSERT_EQ(j.size(), 17u);
    for (int id = 0; id < 17; ++id) {
        const json& e = j[id];
        EXPECT_EQ(e.size(), 11u);
        for (const char* k : {"name", "text", "fullText", "minText", "maxText"}) ASSERT_TRUE(e[k].is_string()) << k;
        for (const char* k : {"value", "minimum", "maximum", "default"}) ASSERT_TRUE(e[k].is_number_integer()) << k;
        EXPECT_EQ(e["id"], id);
        EXPECT_TRUE(e["minimum"] <= e["value"] && e["value"] <= e["maximum"]) << id;
        EXPECT_TRUE(e["position"] >= 0.0 && e["position"] <= 1.0) << id;
    }
    EXPECT_TRUE(j[6]["minText"] == "-Inf." && j[11]["minText"] == "Off") << "the texts at the ends of a range";
    EXPECT_DOUBLE_EQ(j[7]["position"].get<double>(), 600.0 / 660.0) << "0 dB on a -60..+6 dB fader";
    for (const auto& [args, lines] : {std::pair<const char*, long>{"params", 18}, {"ir", 4}}) {
        const std::string out = run({args}).out;  // a header and the rows
        EXPECT_EQ(std::count(out.begin(), out.end(), '\n'), lines) << args;
    }
}

TEST_F(CliTest, SettingsApplyInOrderAlgorithmStateThenEdits) {
    // The value of parameter id that "params --json" shows after args.
    auto value = [&](std::vector<std::string> args, int id) {
        args.insert(args.begin(), {"params", "--json"});
        const RunResult r = run(args);
        return r.status == 0 ? json::parse(r.out).at(id)["value"].get<int32_t>() : INT32_MIN;  // MIN: refused
    };
    EXPECT_EQ(value({"--set", "Pre Delay=40", "--set-raw", "1=50"}, 1), 50);
    EXPECT_EQ(value({"--set-raw", "1=50", "--set", "Pre Delay=40"}, 1), 40);
    EXPECT_EQ(value({"--set=Pre Delay=40", "--set-raw=Pre Delay=60"}, 1), 60);
    // Switching algorithm loads that algorithm's remembered row: an edit before it is replaced, one
    // after it stays.
    EXPECT_EQ(value({"--set", "Decay=12", "--set", "Algorithm=large room"}, 2), value({"--algorithm", "4"}, 2));
    EXPECT_EQ(value({"--set", "Algorithm=4", "--set", "Decay=12"}, 2), 12);
    EXPECT_EQ(value({"--preset", "LARGE ROOM *****"}, 15), 4);
    // The state file is loaded after the algorithm: its values win, and edits after it win again.
    ASSERT_EQ(run({"presets", "--dir", "P", "save", "s", "--algorithm", "5", "--set", "Decay=33"}).status, 0);
    EXPECT_TRUE(value({"--algorithm", "1", "--state", "P/s.stp"}, 15) == 5 &&
                value({"--algorithm", "1", "--state", "P/s.stp"}, 2) == 33);
    EXPECT_EQ(value({"--algorithm", "1", "--state", "P/s.stp", "--set", "Decay=44"}, 2), 44);
}

TEST_F(CliTest, PresetCommandsManageTheFolder) {
    auto cmd = [&](std::vector<std::string> args) {
        args.insert(args.begin(), {"presets", "--dir", "Presets"});
        return run(args);
    };
    EXPECT_EQ(cmd({"list"}).out, "");
    EXPECT_FALSE(fs::exists(dir_ / "Presets")) << "listing does not create the folder";
    ASSERT_EQ(cmd({"save", "Hall A", "--preset", "bright hall", "--set", "Pre Delay=40"}).status, 0);
    ASSERT_EQ(cmd({"save", "Plate", "--algorithm", "0"}).status, 0);
    EXPECT_EQ(cmd({"list"}).out, "Hall A\nPlate\n");
    const std::string shown = cmd({"show", "Hall A"}).out;
    EXPECT_NE(shown.find("Pre Delay: 40\nDecay"), std::string::npos) << shown;
    EXPECT_NE(shown.find("Algorithm: BRIGHT HALL **** (5)\n"), std::string::npos) << shown;

    // Without --force and without a terminal to ask on, an existing preset is kept byte for byte.
    const std::string before = slurp(dir_ / "Presets" / "Hall A.stp");
    expectOneSentence(cmd({"save", "Hall A", "--algorithm", "3"}), 2);
    EXPECT_EQ(slurp(dir_ / "Presets" / "Hall A.stp"), before);
    ASSERT_EQ(cmd({"save", "Hall A", "--algorithm", "3", "--force"}).status, 0);
    EXPECT_NE(slurp(dir_ / "Presets" / "Hall A.stp"), before);

    // A preset whose suffix is upper case is the same preset to every command.
    fs::rename(dir_ / "Presets" / "Plate.stp", dir_ / "Presets" / "Plate.STP");
    EXPECT_EQ(cmd({"list"}).out, "Hall A\nPlate\n");
    EXPECT_EQ(cmd({"show", "Plate"}).status, 0);
    expectOneSentence(cmd({"save", "Plate"}), 2);
    ASSERT_EQ(cmd({"save", "Plate", "--force"}).status, 0);
    EXPECT_EQ(cmd({"list"}).out, "Hall A\nPlate\n");
    ASSERT_EQ(cmd({"delete", "Plate"}).status, 0);
    for (const char* command : {"delete", "show"}) expectOneSentence(cmd({command, "Plate"}), 2);
    for (const char* bad : {"../x", "..\\..\\x", "a:b", "what?", "st*r"})
        for (const char* command : {"save", "delete"}) expectOneSentence(cmd({command, bad}), 2);
    EXPECT_EQ(listing(), (std::vector<std::string>{"Presets"}));
    EXPECT_EQ(listing("Presets"), (std::vector<std::string>{"Hall A.stp"}));

    // Without --dir: $XDG_DATA_HOME/ulvetta/Presets, else ~/.local/share/ulvetta/Presets.
    ASSERT_EQ(run({"presets", "save", "Mine"}, "XDG_DATA_HOME=" + shellQuote((dir_ / "data").string())).status, 0);
    EXPECT_TRUE(fs::is_regular_file(dir_ / "data" / "ulvetta" / "Presets" / "Mine.stp"));
    ASSERT_EQ(run({"presets", "save", "Mine"}, "XDG_DATA_HOME= HOME=" + shellQuote((dir_ / "home").string())).status, 0);
    EXPECT_TRUE(fs::is_regular_file(dir_ / "home" / ".local" / "share" / "ulvetta" / "Presets" / "Mine.stp"));
}

// The export of a prepared response must equal what a unit impulse draws from the renderer.
TEST_F(CliTest, IrExportEqualsTheRenderedImpulseResponse) {
    for (const char* rate : {"44100", "32000"}) {
        SCOPED_TRACE(rate);
        const auto settings = {"Decay=20", "Room Size=120", "Damping=40"};
        ASSERT_EQ(run(sets({"ir", "--algorithm", "4", "--rate", rate, "response.wav"}, settings)).status, 0);
        const Audio response = read("response.wav");
        ASSERT_TRUE(response.format == (SF_FORMAT_WAV | SF_FORMAT_FLOAT) && response.channels == 2 &&
                    response.rate == std::atoi(rate) && response.frames() > 1000);

        // A unit impulse on both channels through the same settings, no dry path, filters off.
        std::vector<float> impulse(2 * 64, 0.0f);
        impulse[0] = impulse[1] = 1.0f;
        write("impulse.wav", std::atoi(rate), 2, impulse);
        const std::vector<std::string> render = sets(
            sets({"render", "impulse.wav", "out.wav", "--algorithm", "4"}, settings),
            {"Output Level Wet=0", "Output Level Dry=-Inf.", "Colour=100", "Low Pass Freq=Off", "High Pass Freq=Off"});
        ASSERT_EQ(run(render).status, 0);
        const Audio out = read("out.wav");
        // The tail ends irLength - 1 frames after the input: exactly the response's length plus the input's.
        ASSERT_EQ(out.frames(), 64 + response.frames() - 1);
        for (long long i = 0; i < 2 * (response.frames() - 1); ++i)
            ASSERT_NEAR(out.floats[i], response.floats[i], 2e-6) << i;
    }
}

TEST_F(CliTest, SkinSheetIsAWholePngOrNothing) {
    ASSERT_EQ(run({"skin", "sheet.png"}).status, 0);
    const std::string png = slurp(dir_ / "sheet.png");
    ASSERT_GT(png.size(), 24u);
    EXPECT_EQ(png.substr(0, 8), "\x89PNG\r\n\x1a\n");
    const auto byte = [&](size_t i) { return static_cast<unsigned char>(png[i]); };
    EXPECT_EQ(byte(16) << 24 | byte(17) << 16 | byte(18) << 8 | byte(19), 1024);  // IHDR width
    expectOneSentence(run({"skin", "missing/sheet.png"}), 1);
    EXPECT_EQ(listing(), std::vector<std::string>{"sheet.png"});
}

}  // namespace
}  // namespace ulvetta::testing
