#include "filter/PersistRecord.h"

#include <algorithm>

#include "filter/CoreState.h"

namespace ulvetta {

PersistRecord::Result PersistRecord::read(RecordSource& source) {
    size_ = 0;
    std::fill(buffer_, buffer_ + kCapacity, uint8_t{0});
    uint32_t got = 0;
    if (!source.read(buffer_, kHeadSize, &got)) return Result::StreamError;
    const uint32_t claimed = getLe32(buffer_);
    if (claimed <= kHeadSize) return Result::Refused;
    const uint64_t wanted = claimed - kHeadSize;
    uint64_t done = 0;
    if (claimed <= kCapacity) {
        got = 0;
        if (!source.read(buffer_ + kHeadSize, static_cast<uint32_t>(wanted), &got)) return Result::StreamError;
        done = got;
    } else {
        // A record larger than ours cannot be valid: consume it in bounded pieces without holding it.
        uint8_t discard[kCapacity];
        while (done < wanted) {
            const uint32_t n = static_cast<uint32_t>(std::min<uint64_t>(sizeof discard, wanted - done));
            got = 0;
            if (!source.read(discard, n, &got)) return Result::StreamError;
            if (got == 0) break;  // the stream ended early
            done += std::min<uint64_t>(got, n);
        }
    }
    // A short read leaves part of the record unknown; like a record too large to be ours, it is refused.
    if (claimed > kCapacity || done < wanted) return Result::Refused;
    size_ = claimed;
    return Result::Complete;
}

}  // namespace ulvetta
