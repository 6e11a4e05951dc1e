// Every argument the routines refuse, reported through the handler with its status, text, routine name
// and message, with the data left untouched; the status texts; the two shipped handlers.
#include <vector>

#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;

namespace {

void expectReport(CaptureErrors& cap, int status, const char* routine, const char* message) {
    const Reported r = cap.take();
    EXPECT_EQ(r.calls, 1) << routine << ": " << message;
    EXPECT_EQ(r.status, status) << routine << ": " << message;
    EXPECT_EQ(r.routine, routine);
    EXPECT_EQ(r.message, message);
    EXPECT_EQ(nspGetErrStatus(), status);
    nspSetErrStatus(NspStsOk);
}

}  // namespace

TEST(NspStatus, CodesHaveTheirTexts) {
    EXPECT_STREQ(nspErrorStr(0), "No Error");
    EXPECT_STREQ(nspErrorStr(-1), "Backtrace");
    EXPECT_STREQ(nspErrorStr(-3), "Internal error (bad state)");
    EXPECT_STREQ(nspErrorStr(-4), "Out of memory");
    EXPECT_STREQ(nspErrorStr(-5), "Bad argument");
    EXPECT_STREQ(nspErrorStr(-6), "Unsupported function");
    EXPECT_STREQ(nspErrorStr(-7), "Iteration convergence failed");
    EXPECT_STREQ(nspErrorStr(-8), "Autotrace call");
    for (int other : {-2, -9, 1, 42}) EXPECT_STREQ(nspErrorStr(other), "Unknown error or status code");
}

TEST(NspStatus, DefaultHandlerRecordsAndReturns) {
    nspRedirectError(nullptr);
    nspSetErrStatus(NspStsOk);
    std::vector<float> x(4, 1.0f);
    nspsRealFftl(x.data(), 32, FlagForward | FlagOutPerm);  // the process goes on
    EXPECT_EQ(nspGetErrStatus(), NspStsBadArg);
    EXPECT_EQ(x, std::vector<float>(4, 1.0f));
    nspSetErrStatus(NspStsOk);
}

TEST(NspStatusDeathTest, ExitHandlerEndsTheProcessWithCodeOne) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            nspRedirectError(&nspExitErrorHandler);
            nspsRealFftl(nullptr, 32, FlagForward | FlagOutPerm);
        },
        testing::ExitedWithCode(1), "nspsRealFftl: Bad argument \\(order>31\\)");
}

TEST(NspArgumentErrors, TransformsReportAndLeaveTheirData) {
    CaptureErrors cap;
    const std::vector<float> orig = randomFloats(64, seed(1200));
    std::vector<float> x(orig), y(64, 3.0f);
    const int fwd = FlagForward | FlagOutPerm, inv = FlagInverse | FlagInPerm;
    struct Case {
        const char* routine;
        int order, flags;
        bool nullData;
        int status;
        const char* message;
    };
    const Case cases[] = {
        {"nspsRealFftl", -1, fwd, false, NspStsBadArg, "order<0"},
        {"nspsRealFftl", 32, fwd, false, NspStsBadArg, "order>31"},
        {"nspsRealFftl", 6, fwd, true, NspStsBadArg, "samps==0"},
        {"nspsRealFftl", 6, FlagForward | FlagInverse | FlagOutPerm, false, NspStsBadArg, "(flags & 1) && (flags & 2)"},
        {"nspsRealFftl", 6, FlagOutPerm, false, NspStsBadArg, "(flags & 1)==0 && (flags & 2)==0"},
        {"nspsRealFftl", 6, FlagForward | FlagOutPack | FlagOutPerm, false, NspStsBadArg, "(flags & 256) && (flags & 512)"},
        {"nspsRealFftl", 6, FlagForward | FlagInPerm, false, NspStsBadArg, "(flags & 256)==0 && (flags & 512)==0"},
        {"nspsRealFftl", 6, FlagInverse | FlagOutPerm, false, NspStsUnsupported, "inverse transform: use nspsCcsFftl"},
        {"nspsCcsFftl", -3, inv, false, NspStsBadArg, "order<0"},
        {"nspsCcsFftl", 40, inv, false, NspStsBadArg, "order>31"},
        {"nspsCcsFftl", 6, inv, true, NspStsBadArg, "samps==0"},
        {"nspsCcsFftl", 6, FlagForward | FlagInverse | FlagInPerm, false, NspStsBadArg, "(flags & 1) && (flags & 2)"},
        {"nspsCcsFftl", 6, FlagInPerm, false, NspStsBadArg, "(flags & 1)==0 && (flags & 2)==0"},
        {"nspsCcsFftl", 6, FlagInverse | FlagInPack | FlagInPerm, false, NspStsBadArg, "(flags & 1024) && (flags & 4096)"},
        {"nspsCcsFftl", 6, FlagInverse | FlagOutPerm, false, NspStsBadArg, "(flags & 1024)==0 && (flags & 4096)==0"},
        {"nspsCcsFftl", 6, FlagForward | FlagInPerm, false, NspStsUnsupported, "forward transform: use nspsRealFftl"},
    };
    for (const Case& c : cases) {
        if (std::string(c.routine) == "nspsRealFftl")
            nspsRealFftl(c.nullData ? nullptr : x.data(), c.order, c.flags);
        else
            nspsCcsFftl(c.nullData ? nullptr : x.data(), c.order, c.flags);
        expectReport(cap, c.status, c.routine, c.message);
        ASSERT_EQ(x, orig) << c.routine << ": " << c.message;
    }

    const char* nip = "nspsRealFftlNip";
    nspsRealFftlNip(x.data(), y.data(), -1, fwd);
    expectReport(cap, NspStsBadArg, nip, "order<0");
    nspsRealFftlNip(x.data(), y.data(), 32, fwd);
    expectReport(cap, NspStsBadArg, nip, "order>31");
    nspsRealFftlNip(nullptr, y.data(), 6, fwd);
    expectReport(cap, NspStsBadArg, nip, "inSamps==0");
    nspsRealFftlNip(x.data(), nullptr, 6, fwd);
    expectReport(cap, NspStsBadArg, nip, "outSamps==0");
    nspsRealFftlNip(x.data(), y.data(), 6, FlagForward | FlagInverse | FlagOutPerm);
    expectReport(cap, NspStsBadArg, nip, "(flags & 1) && (flags & 2)");
    nspsRealFftlNip(x.data(), y.data(), 6, FlagForward);
    expectReport(cap, NspStsBadArg, nip, "(flags & 256)==0 && (flags & 512)==0");
    std::vector<float> z(80, 2.0f);
    nspsRealFftlNip(z.data(), z.data() + 8, 6, fwd);  // partly overlapping buffers
    expectReport(cap, NspStsBadArg, nip, "inSamps and outSamps overlap");
    EXPECT_EQ(x, orig);
    EXPECT_EQ(y, std::vector<float>(64, 3.0f));
    EXPECT_EQ(z, std::vector<float>(80, 2.0f));

    const char* mpy = "nspsMpyRCPerm2";
    nspsMpyRCPerm2(x.data(), y.data(), -1);
    expectReport(cap, NspStsBadArg, mpy, "order<0");
    nspsMpyRCPerm2(x.data(), y.data(), 32);
    expectReport(cap, NspStsBadArg, mpy, "order>31");
    nspsMpyRCPerm2(nullptr, y.data(), 6);
    expectReport(cap, NspStsBadArg, mpy, "src==0");
    nspsMpyRCPerm2(x.data(), nullptr, 6);
    expectReport(cap, NspStsBadArg, mpy, "dst==0");
    nspsMpyRCPerm2(z.data(), z.data() + 2, 6);
    expectReport(cap, NspStsBadArg, mpy, "src and dst overlap");
    EXPECT_EQ(y, std::vector<float>(64, 3.0f));
    EXPECT_EQ(z, std::vector<float>(80, 2.0f));
}

TEST(NspArgumentErrors, FirRoutinesReportNullAndUninitialisedStates) {
    CaptureErrors cap;
    const float taps[4] = {1, 2, 3, 4};
    EXPECT_EQ(nspsFirInit(taps, 4, nullptr, nullptr), 0);
    expectReport(cap, NspStsBadArg, "nspsFirInit", "Null state pointer");
    FirState s;
    EXPECT_EQ(nspsFirInit(taps, 0, nullptr, &s), 0);
    expectReport(cap, NspStsBadArg, "nspsFirInit", "Invalid value");
    EXPECT_EQ(s.initMarker, nullptr);

    nspsFirSetTaps(taps, nullptr);
    expectReport(cap, NspStsBadArg, "nspsFirSetTaps", "Null state pointer");
    nspsFirSetTaps(taps, &s);
    expectReport(cap, NspStsBadArg, "nspsFirSetTaps", "Must have been initialized");
    nspsFirSetDlyl(taps, nullptr);
    expectReport(cap, NspStsBadArg, "nspsFirSetDlyl", "Null state pointer");
    nspsFirSetDlyl(taps, &s);
    expectReport(cap, NspStsBadArg, "nspsFirSetDlyl", "Must have been initialized");
    EXPECT_EQ(nspsFir(nullptr, 1.0f), 0.0f);
    expectReport(cap, NspStsBadArg, "nspsFir", "Null state pointer");
    EXPECT_EQ(nspsFir(&s, 1.0f), 0.0f);
    expectReport(cap, NspStsBadArg, "nspsFir", "Must have been initialized");
    nspFirFree(nullptr);
    expectReport(cap, NspStsBadArg, "nspFirnspFree", "Null state pointer");
    nspFirFree(&s);
    expectReport(cap, NspStsBadArg, "nspFirnspFree", "Must have been initialized");

    // A copied state is not initialised: its marker is the original's address.
    ASSERT_NE(nspsFirInit(taps, 4, nullptr, &s), 0);
    FirState copy = s;
    EXPECT_EQ(nspsFir(&copy, 1.0f), 0.0f);
    expectReport(cap, NspStsBadArg, "nspsFir", "Must have been initialized");
    // A refused re-initialisation keeps the working state.
    EXPECT_EQ(nspsFirInit(taps, -1, nullptr, &s), 0);
    expectReport(cap, NspStsBadArg, "nspsFirInit", "Invalid value");
    EXPECT_EQ(nspsFir(&s, 1.0f), 1.0f);  // h[0]
    EXPECT_EQ(nspsFir(&s, 0.0f), 2.0f);  // h[1]
    nspFirFree(&s);
    EXPECT_EQ(cap.take().calls, 0);
}
