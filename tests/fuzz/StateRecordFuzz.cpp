// Loads arbitrary bytes as the 88-byte settings record into one long-lived core, as a host loading one
// project after another. The record must be accepted exactly when it is 88 bytes with the size field 88 and
// the format GUID; an accepted record leaves every value at its own, clamped into range, and a block then
// processes to finite output; a refused one changes nothing.
#include <algorithm>
#include <array>
#include <cmath>

#include "FuzzBytes.h"
#include "FuzzCore.h"

using namespace ulvetta;
using namespace ulvetta::fuzz;

namespace {

// Parameter id stored at each 4-byte slot after the head.
constexpr int32_t kIdAtSlot[17] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 14, 13, 12, 15, 16};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    ReverbCore& core = lowRateCore();
    const auto before = valuesOf(core);
    const bool valid = size == 88 && std::equal(kRecordHead, kRecordHead + 20, data);
    const int32_t length = static_cast<int32_t>(std::min<size_t>(size, 1 << 20));
    FUZZ_CHECK(core.validateState(data, length) == valid);
    FUZZ_CHECK(core.loadState(data, length) == valid);
    const auto after = valuesOf(core);
    if (!valid) {
        FUZZ_CHECK(after == before);
        return 0;
    }
    for (int slot = 0; slot < kParamCount; ++slot) {
        const int32_t id = kIdAtSlot[slot];
        const uint8_t* p = data + 20 + 4 * slot;
        const int32_t stored = static_cast<int32_t>(p[0] | p[1] << 8 | p[2] << 16 | static_cast<uint32_t>(p[3]) << 24);
        FUZZ_CHECK(after[id] == std::clamp(stored, kParamTable[id].minimum, kParamTable[id].maximum));
    }
    float in[2 * 64] = {1.0f, -1.0f}, out[2 * 64];
    core.processStereo(in, in + 1, out, out + 1, 64, 2, 0, 0, 0);
    FUZZ_CHECK(std::all_of(out, out + 128, [](float x) { return std::isfinite(x); }));
    return 0;
}
