// The stored stereo impulse responses of the convolution modes: interleaved float frames at 44100 Hz,
// held in the module's read-only data.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ulvetta {

struct StoredResponse {
    const float* frames;  // interleaved left, right
    int32_t count;        // frames
};

constexpr int32_t kStoredFramesBrightHall = 104830;
constexpr int32_t kStoredFramesLargeRoom = 135168;
constexpr int32_t kStoredFramesAuditorium = 103898;

// The response of convolution mode 3, 4 or 5; {nullptr, 0} for another mode.
StoredResponse storedResponse(int mode);
// The three responses in their stored order (bright hall, large room, auditorium), for inspection.
StoredResponse storedResponseAt(int index);
// Bytes of all three, as embedded.
size_t storedResponseBytes();

}  // namespace ulvetta
