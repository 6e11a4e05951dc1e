// The transforms, the spectrum product and the FIR filter allocate nothing once their tables and buffers
// exist, counted through the test binary's replaced global operator new.
#include <vector>

#include "SpectralTestSupport.h"
#include "support/AllocationCounter.h"

using namespace ulvetta;
using namespace spectral_test;

TEST(SpectralAllocation, NothingIsAllocatedOnceTablesAndBuffersExist) {
    const int first = 6, last = 17;
    // Building the tables of an order does allocate: the counter sees the library's allocations.
    nspsRealFftl(nullptr, 12, FlagRelease);
    {
        AllocationCounter counter;
        nspsRealFftl(nullptr, 12, FlagInitOnly);
        EXPECT_GT(counter.count(), 0);
    }
    std::vector<std::vector<float>> data, spare;
    for (int order = first; order <= last; ++order) {
        nspsRealFftl(nullptr, order, FlagInitOnly);
        data.push_back(randomFloats(std::size_t(1) << order, seed(2000 + order)));
        spare.push_back(data.back());
    }
    FirState fir;
    const std::vector<float> taps = randomFloats(64, seed(2100));
    ASSERT_NE(nspsFirInit(taps.data(), 64, nullptr, &fir), 0);
    float sink = 0.0f;
    for (spectral::Isa isa : availableIsas()) {
        IsaScope scope(isa);
        AllocationCounter counter;
        for (int order = first; order <= last; ++order) {
            std::vector<float>& x = data[order - first];
            std::vector<float>& y = spare[order - first];
            nspsRealFftl(x.data(), order, FlagForward | FlagOutPerm);
            nspsRealFftlNip(x.data(), y.data(), order, FlagForward | FlagOutPack);
            nspsMpyRCPerm2(x.data(), x.data(), order);
            nspsCcsFftl(x.data(), order, FlagInverse | FlagInPerm);
            nspsCcsFftl(y.data(), order, FlagInverse | FlagInPack | FlagNoScale);
        }
        for (int n = 0; n < 300; ++n) sink += nspsFir(&fir, float(n % 5));  // crosses window moves
        nspsFirSetTaps(taps.data(), &fir);
        nspsFirSetDlyl(nullptr, &fir);
        EXPECT_EQ(counter.count(), 0) << "instruction set " << int(isa);
    }
    nspFirFree(&fir);
    EXPECT_TRUE(std::isfinite(sink));
}
