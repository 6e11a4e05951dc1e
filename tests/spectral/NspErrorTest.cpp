// Every argument the routines refuse is reported once through the handler, with its status and routine,
// and leaves the data untouched; the default handler records and returns, the exit handler ends the process.
#include <functional>
#include <string>

#include "SpectralTestSupport.h"

using namespace ulvetta;
using namespace spectral_test;

namespace {

// Counts the reports and keeps the last one while installed.
struct Reported {
    int calls = 0, status = 0;
    std::string routine;
};
Reported gReported;

class CaptureErrors {
public:
    CaptureErrors() : previous_(nspRedirectError([](int status, const char* routine, const char*) {
        gReported = {gReported.calls + 1, status, routine ? routine : ""};
    })) {}
    ~CaptureErrors() { nspRedirectError(previous_); }
    Reported take() {
        const Reported r = gReported;
        gReported = Reported{};
        nspSetErrStatus(NspStsOk);
        return r;
    }

private:
    NspErrorHandler previous_;
};

}  // namespace

TEST(NspStatus, DefaultHandlerRecordsAndReturnsAndExitHandlerEndsTheProcess) {
    nspRedirectError(nullptr);
    std::vector<float> x(4, 1.0f);
    nspsRealFftl(x.data(), 32, FlagForward | FlagOutPerm);  // the process goes on
    EXPECT_EQ(nspGetErrStatus(), NspStsBadArg);
    EXPECT_EQ(x, std::vector<float>(4, 1.0f));
    nspSetErrStatus(NspStsOk);
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            nspRedirectError(&nspExitErrorHandler);
            nspsRealFftl(nullptr, 32, FlagForward | FlagOutPerm);
        },
        testing::ExitedWithCode(1), "nspsRealFftl: Bad argument \\(order>31\\)");
}

TEST(NspArgumentErrors, EveryRefusedCallIsReportedOnceAndLeavesItsData) {
    CaptureErrors cap;
    const std::vector<float> orig = randomFloats(80, seed(1200));
    std::vector<float> x(orig), y(orig);
    float* p = x.data();
    float* q = y.data();
    const int fwd = FlagForward | FlagOutPerm, inv = FlagInverse | FlagInPerm;
    const struct {
        const char* routine;
        int status;
        std::function<void()> call;
    } cases[] = {
        {"nspsRealFftl", NspStsBadArg, [&] { nspsRealFftl(p, -1, fwd); }},
        {"nspsRealFftl", NspStsBadArg, [&] { nspsRealFftl(nullptr, 6, fwd); }},
        {"nspsRealFftl", NspStsBadArg, [&] { nspsRealFftl(p, 6, fwd | FlagInverse); }},
        {"nspsRealFftl", NspStsBadArg, [&] { nspsRealFftl(p, 6, fwd | FlagOutPack); }},
        {"nspsRealFftl", NspStsBadArg, [&] { nspsRealFftl(p, 6, FlagForward | FlagInPerm); }},
        {"nspsRealFftl", NspStsUnsupported, [&] { nspsRealFftl(p, 6, FlagInverse | FlagOutPerm); }},
        {"nspsCcsFftl", NspStsBadArg, [&] { nspsCcsFftl(p, 40, inv); }},
        {"nspsCcsFftl", NspStsBadArg, [&] { nspsCcsFftl(nullptr, 6, inv); }},
        {"nspsCcsFftl", NspStsBadArg, [&] { nspsCcsFftl(p, 6, inv | FlagInPack); }},
        {"nspsCcsFftl", NspStsBadArg, [&] { nspsCcsFftl(p, 6, FlagInverse | FlagOutPerm); }},
        {"nspsCcsFftl", NspStsUnsupported, [&] { nspsCcsFftl(p, 6, FlagForward | FlagInPerm); }},
        {"nspsRealFftlNip", NspStsBadArg, [&] { nspsRealFftlNip(nullptr, q, 6, fwd); }},
        {"nspsRealFftlNip", NspStsBadArg, [&] { nspsRealFftlNip(p, nullptr, 6, fwd); }},
        {"nspsRealFftlNip", NspStsBadArg, [&] { nspsRealFftlNip(p, p + 8, 6, fwd); }},  // overlapping
        {"nspsMpyRCPerm2", NspStsBadArg, [&] { nspsMpyRCPerm2(nullptr, q, 6); }},
        {"nspsMpyRCPerm2", NspStsBadArg, [&] { nspsMpyRCPerm2(p, nullptr, 6); }},
        {"nspsMpyRCPerm2", NspStsBadArg, [&] { nspsMpyRCPerm2(p, p + 2, 6); }},  // overlapping
    };
    for (const auto& c : cases) {
        c.call();
        EXPECT_EQ(nspGetErrStatus(), c.status) << c.routine;
        const Reported r = cap.take();
        EXPECT_TRUE(r.calls == 1 && r.status == c.status && r.routine == c.routine) << c.routine;
        ASSERT_TRUE(x == orig && y == orig) << c.routine;
    }
}

// A null, an uninitialised or a copied state is refused; a refused re-initialisation keeps the working one.
TEST(NspArgumentErrors, FirRoutinesRefuseStatesNotInitialisedInPlace) {
    CaptureErrors cap;
    const float taps[4] = {1, 2, 3, 4};
    FirState s;
    EXPECT_EQ(nspsFirInit(taps, 4, nullptr, nullptr), 0);
    EXPECT_EQ(nspsFirInit(taps, 0, nullptr, &s), 0);
    nspsFirSetTaps(taps, &s);
    nspsFirSetDlyl(taps, nullptr);
    EXPECT_EQ(nspsFir(&s, 1.0f), 0.0f);
    nspFirFree(nullptr);
    EXPECT_EQ(cap.take().calls, 6);
    ASSERT_NE(nspsFirInit(taps, 4, nullptr, &s), 0);
    FirState copy = s;
    EXPECT_EQ(nspsFir(&copy, 1.0f), 0.0f);
    EXPECT_EQ(nspsFirInit(taps, -1, nullptr, &s), 0);
    EXPECT_EQ(cap.take().calls, 2);
    EXPECT_EQ(nspsFir(&s, 1.0f), 1.0f);  // h[0]
    EXPECT_EQ(nspsFir(&s, 0.0f), 2.0f);  // h[1]
    nspFirFree(&s);
    EXPECT_EQ(cap.take().calls, 0);
}
