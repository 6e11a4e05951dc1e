// What the fuzz targets that drive a core share: the settings record's fixed head, a core kept for the
// whole run, and a snapshot of its values.
#pragma once

#include <array>
#include <cstdint>

#include "filter/ReverbCore.h"

namespace ulvetta {
namespace fuzz {

// The record's size field (88) and format GUID, as written to disk by every version.
constexpr uint8_t kRecordHead[20] = {88,   0,    0,    0,    0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f,
                                     0xd5, 0x11, 0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57};

// One core for the whole run, at the lowest rate a stream may have: loading a record or switching
// algorithm applies every value to the engine, and the responses of the convolution algorithms are
// prepared quickest there, so more inputs are tried per second.
inline ReverbCore& lowRateCore() {
    static ReverbCore& core = *[] {
        auto* c = new ReverbCore;
        c->setFormat(1000.0f, 0, 2, 2);
        return c;
    }();
    return core;
}

inline std::array<int32_t, kParamCount> valuesOf(ReverbCore& core) {
    std::array<int32_t, kParamCount> v;
    for (int32_t id = 0; id < kParamCount; ++id) v[id] = core.getValue(id);
    return v;
}

}  // namespace fuzz
}  // namespace ulvetta
