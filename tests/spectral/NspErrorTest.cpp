// Every argument the routines refuse sets the error status and leaves the data untouched under the default
// handler, which records and returns; the exit handler ends the process.
#include <functional>

#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;

TEST(NspStatus, ExitHandlerEndsTheProcessWithTheMessage) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            nspRedirectError(&nspExitErrorHandler);
            nspsRealFftl(nullptr, 32, FlagForward | FlagOutPerm);
        },
        testing::ExitedWithCode(1), "nspsRealFftl: Bad argument \\(order>31\\)");
}

TEST(NspArgumentErrors, EveryRefusedCallSetsTheStatusAndLeavesItsData) {
    nspRedirectError(nullptr);
    const std::vector<float> orig = randomFloats(80, seed(1200));
    std::vector<float> x(orig), y(orig);
    float* p = x.data();
    float* q = y.data();
    const int fwd = FlagForward | FlagOutPerm, inv = FlagInverse | FlagInPerm;
    const float taps[4] = {1, 2, 3, 4};
    FirState uninitialised;
    const std::function<void()> badArguments[] = {
        [&] { nspsRealFftl(p, -1, fwd); },
        [&] { nspsRealFftl(p, 32, fwd); },
        [&] { nspsRealFftl(nullptr, 6, fwd); },
        [&] { nspsRealFftl(p, 6, fwd | FlagOutPack); },
        [&] { nspsCcsFftl(p, 6, inv | FlagInPack); },
        [&] { nspsRealFftlNip(nullptr, q, 6, fwd); },
        [&] { nspsRealFftlNip(p, p + 8, 6, fwd); },  // overlapping
        [&] { nspsMpyRCPerm2(nullptr, q, 6); },
        [&] { nspsMpyRCPerm2(p, p + 2, 6); },  // overlapping
        [&] { nspsFirInit(taps, 4, nullptr, nullptr); },
        [&] { nspsFirInit(taps, 0, nullptr, &uninitialised); },
        [&] { nspsFirSetTaps(taps, &uninitialised); },
        [&] { nspsFir(&uninitialised, 1.0f); },
        [&] { nspFirFree(nullptr); },
    };
    for (size_t i = 0; i < std::size(badArguments); ++i) {
        nspSetErrStatus(NspStsOk);
        badArguments[i]();
        EXPECT_EQ(nspGetErrStatus(), NspStsBadArg) << "case " << i;
        ASSERT_TRUE(x == orig && y == orig) << "case " << i;
    }
    nspSetErrStatus(NspStsOk);
    nspsRealFftl(p, 6, FlagInverse | FlagOutPerm);
    EXPECT_EQ(nspGetErrStatus(), NspStsUnsupported);
    nspsCcsFftl(p, 6, FlagForward | FlagInPerm);
    EXPECT_EQ(nspGetErrStatus(), NspStsUnsupported);
    EXPECT_EQ(x, orig);
    nspSetErrStatus(NspStsOk);
}
