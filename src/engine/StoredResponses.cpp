#include "engine/StoredResponses.h"

extern "C" const float ulvetta_stored_responses[];
extern "C" const unsigned char ulvetta_stored_responses_end[];

namespace ulvetta {

StoredResponse storedResponseAt(int index) {
    const int32_t counts[3] = {kStoredFramesBrightHall, kStoredFramesLargeRoom, kStoredFramesAuditorium};
    if (index < 0 || index > 2) return {nullptr, 0};
    const float* at = ulvetta_stored_responses;
    for (int i = 0; i < index; ++i) at += 2 * static_cast<size_t>(counts[i]);
    return {at, counts[index]};
}

StoredResponse storedResponse(int mode) {
    switch (mode) {
        case 3: return storedResponseAt(2);
        case 4: return storedResponseAt(1);
        case 5: return storedResponseAt(0);
        default: return {nullptr, 0};
    }
}

size_t storedResponseBytes() {
    return static_cast<size_t>(ulvetta_stored_responses_end - reinterpret_cast<const unsigned char*>(ulvetta_stored_responses));
}

}  // namespace ulvetta
