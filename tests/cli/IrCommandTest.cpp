// `ulvetta ir`: the report of the stored responses and the export of a prepared one, which must equal the
// response that a unit impulse draws from the renderer.
#include <gtest/gtest.h>

#include "CliHarness.h"

namespace ulvetta::testing {

class IrCommand : public CliTest {};

TEST_F(IrCommand, ReportsTheThreeStoredResponses) {
    const RunResult r = run({"ir"});
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_NE(r.out.find("AUDITORIUM ****"), std::string::npos);
    EXPECT_NE(r.out.find("135168"), std::string::npos);
    EXPECT_NE(r.out.find("0.3000"), std::string::npos);
}

TEST_F(IrCommand, ExportEqualsTheRenderedImpulseResponse) {
    for (const char* rate : {"44100", "32000"}) {
        SCOPED_TRACE(rate);
        const std::vector<std::string> settings = {"--algorithm", "4", "--set", "Decay=20", "--set", "Room Size=120",
                                                   "--set",       "Damping=40"};
        std::vector<std::string> exportArgs = {"ir", "--rate", rate, "response.wav"};
        exportArgs.insert(exportArgs.begin() + 1, settings.begin(), settings.end());
        const RunResult e = run(exportArgs);
        ASSERT_EQ(e.status, 0) << e.err;
        const Audio response = read("response.wav");
        ASSERT_EQ(response.channels, 2);
        ASSERT_EQ(response.rate, std::atoi(rate));
        ASSERT_GT(response.frames(), 1000);

        // A unit impulse on both channels through the same settings, no dry path, filters off.
        std::vector<float> impulse(2 * 64, 0.0f);
        impulse[0] = impulse[1] = 1.0f;
        writeFloat("impulse.wav", std::atoi(rate), 2, impulse);
        std::vector<std::string> renderArgs = {"render", "impulse.wav", "out.wav"};
        renderArgs.insert(renderArgs.end(), settings.begin(), settings.end());
        for (const char* s : {"Output Level Wet=0", "Output Level Dry=-Inf.", "Colour=100", "Low Pass Freq=Off",
                              "High Pass Freq=Off"}) {
            renderArgs.push_back("--set");
            renderArgs.push_back(s);
        }
        const RunResult r = run(renderArgs);
        ASSERT_EQ(r.status, 0) << r.err;
        const Audio out = read("out.wav");
        // The tail ends irLength - 1 frames after the input: exactly the response's length plus the input's.
        ASSERT_EQ(out.frames(), 64 + response.frames() - 1);
        for (long long i = 0; i < response.frames() - 1; ++i) {
            ASSERT_NEAR(out.floats[2 * i], response.floats[2 * i], 2e-6) << i;
            ASSERT_NEAR(out.floats[2 * i + 1], response.floats[2 * i + 1], 2e-6) << i;
        }
    }
}

TEST_F(IrCommand, RefusesWhatCannotBeExported) {
    expectOneSentence(run({"ir", "--algorithm", "1", "x.wav"}), 2);
    expectOneSentence(run({"ir", "--algorithm", "3", "--rate", "0", "x.wav"}), 2);
    expectOneSentence(run({"ir", "--algorithm", "3", "--rate", "fast", "x.wav"}), 2);
    EXPECT_EQ(listing(), std::vector<std::string>{});
}

}  // namespace ulvetta::testing
