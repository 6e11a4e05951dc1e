// The 88-byte settings record: size, format GUID and the 17 parameter values in table-position order,
// little-endian with no padding. Hosts store it with their project; user presets are this record on disk.
#pragma once

#include <cstdint>

namespace ulvetta {

constexpr int32_t kCoreStateSize = 88;
constexpr int kCoreStateGuidOffset = 4;
constexpr int kCoreStateValuesOffset = 20;

// {3818a524-3f15-11d5-9eda-0010b5071e57} in the Windows in-memory GUID layout.
constexpr uint8_t kCoreStateGuid[16] = {0x24, 0xa5, 0x18, 0x38, 0x15, 0x3f, 0xd5, 0x11,
                                        0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57};

inline void putLe32(uint8_t* p, uint32_t v) {
    p[0] = static_cast<uint8_t>(v);
    p[1] = static_cast<uint8_t>(v >> 8);
    p[2] = static_cast<uint8_t>(v >> 16);
    p[3] = static_cast<uint8_t>(v >> 24);
}

inline uint32_t getLe32(const uint8_t* p) {
    return static_cast<uint32_t>(p[0]) | (static_cast<uint32_t>(p[1]) << 8) | (static_cast<uint32_t>(p[2]) << 16) |
           (static_cast<uint32_t>(p[3]) << 24);
}

}  // namespace ulvetta
