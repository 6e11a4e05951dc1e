// ulvetta snapshot run as a user would: the picture, the settings after scripted events, and refusals that
// leave nothing behind.
#include <png.h>

#include <cstring>

#include "CliHarness.h"
#include "filter/ReverbCore.h"
#include "presets/PresetFile.h"

namespace ulvetta::testing {
namespace {

struct Picture {
    int width = 0, height = 0;
    std::vector<uint8_t> rgb;
    bool black(int x, int y) const {
        const uint8_t* p = &rgb[(static_cast<size_t>(y) * width + x) * 3];
        return p[0] == 0 && p[1] == 0 && p[2] == 0;
    }
};

Picture readPng(const fs::path& path) {
    png_image image;
    std::memset(&image, 0, sizeof image);
    image.version = PNG_IMAGE_VERSION;
    Picture p;
    if (!png_image_begin_read_from_file(&image, path.c_str())) return p;
    image.format = PNG_FORMAT_RGB;
    p.rgb.resize(PNG_IMAGE_SIZE(image));
    if (png_image_finish_read(&image, nullptr, p.rgb.data(), 0, nullptr)) {
        p.width = static_cast<int>(image.width);
        p.height = static_cast<int>(image.height);
    }
    return p;
}

TEST_F(CliTest, SnapshotPlaysEventsAndSavesTheSettingsAfterThem) {
    // Type -12.5 into Output Level Wet (display at 680, 58), then drag Decay's fader to the top.
    std::ofstream(dir_ / "events") << "# wet level\npress 697 64\nrelease 697 64\ntype -12.5\nkey 13\n"
                                      "press 325 100\ndrag 325 0\nrelease 325 0\n";
    const RunResult r = run({"snapshot", "--algorithm", "6", "--set", "Output Level Dry=-6", "--events", "events",
                             "--level", "0.5", "--save-state", "after.stp", "out.png"});
    ASSERT_EQ(r.status, 0) << r.err;
    StateBytes bytes;
    ASSERT_EQ(readStateFile((dir_ / "after.stp").string(), bytes), PresetResult::Ok);
    ReverbCore core;
    ASSERT_TRUE(core.loadState(bytes.data(), static_cast<int32_t>(bytes.size())));
    EXPECT_EQ(core.getValue(kAlgorithm), 6);
    EXPECT_EQ(core.getValue(kOutputLevelDry), -60);
    EXPECT_EQ(core.getValue(kOutputLevelWet), -125);
    EXPECT_EQ(core.getValue(kDecay), 100);

    // At level 0.5 the needle stands straight up from the pivot's column (147) between y 53 and 97; at rest
    // it leans left.
    const Picture streaming = readPng(dir_ / "out.png");
    ASSERT_EQ(streaming.width, 750);
    ASSERT_EQ(streaming.height, 167);
    ASSERT_EQ(run({"snapshot", "--page", "reverb", "rest.png"}).status, 0);
    const Picture rest = readPng(dir_ / "rest.png");
    ASSERT_EQ(rest.width, 750);
    for (int y : {60, 75, 90}) EXPECT_TRUE(streaming.black(147, y) && !rest.black(147, y)) << y;
}

TEST_F(CliTest, SnapshotRefusesBadInputAndWritesNothing) {
    std::ofstream(dir_ / "bad") << "press 10 10\n\n# a comment\nclick 10 10\n";
    std::ofstream(dir_ / "letters") << "type 1a\n";
    const std::pair<std::vector<std::string>, std::string> cases[] = {
        {{"--events", "bad"}, "\"bad\" line 4: \"click 10 10\" is not an event"},
        {{"--events", "letters"}, "\"letters\" line 1: type takes digits"},
        {{"--events", "missing"}, "\"missing\" cannot be read"},
        {{"--events", "."}, "\".\" cannot be read"},
        {{"--page", "mixer"}, "--page takes reverb, filter or about"},
        {{"--level", "1.5"}, "--level takes a number from 0 to 1"},
        {{"--profile", "none.ini"}, "\"none.ini\" does not exist"},
        {{"--algorithm", "9"}, "--algorithm takes 0 to 7"},
    };
    const std::vector<std::string> before = listing();
    for (const auto& [args, message] : cases) {
        std::vector<std::string> full{"snapshot", "--save-state", "s.stp"};
        full.insert(full.end(), args.begin(), args.end());
        full.push_back("out.png");
        const RunResult r = run(full);
        expectOneSentence(r, 2);
        EXPECT_NE(r.err.find(message), std::string::npos) << r.err;
        EXPECT_EQ(listing(), before) << message;
    }
}

}  // namespace
}  // namespace ulvetta::testing
