// Loads arbitrary bytes as the 88-byte settings record into one long-lived core, as a host loading one
// project after another. The record must be accepted exactly when it is 88 bytes with the size field 88 and
// the format GUID; an accepted record leaves every value at its own, clamped into range, and a block then
// processes to finite output; a refused one changes nothing.
#include <algorithm>
#include <array>
#include <cmath>

#include "FuzzBytes.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

// The record's size field and format GUID, as written to disk by every version.
constexpr uint8_t kHead[20] = {88,   0,    0,    0,    0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f,
                               0xd5, 0x11, 0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57};
// Parameter id stored at each 4-byte slot after the head.
constexpr int32_t kIdAtSlot[17] = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 14, 13, 12, 15, 16};

std::array<int32_t, kParamCount> valuesOf(ReverbCore& core) {
    std::array<int32_t, kParamCount> v;
    for (int32_t id = 0; id < kParamCount; ++id) v[id] = core.getValue(id);
    return v;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static ReverbCore& core = *[] {
        // The lowest rate a stream may have: loading applies every value to the engine, and the responses
        // the convolution algorithms prepare are shortest there, so more records are tried per second.
        auto* c = new ReverbCore;
        c->setFormat(1000.0f, 0, 2, 2);
        return c;
    }();
    const auto before = valuesOf(core);
    const bool valid = size == 88 && std::equal(kHead, kHead + 20, data);
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
