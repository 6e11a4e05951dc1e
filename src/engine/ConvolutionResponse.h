// ConvolutionResponse: one prepared response of the convolution algorithms with everything the kernel
// runs it with: the response per channel at the stream rate, its partitions with their spectra and
// workers, and the input history. Built whole off the audio path (ResponsePreparer) and handed to the
// engine, which switches it in at a block boundary; destroying it joins its workers first.
#pragma once

#include <cstdint>
#include <memory>

#include "processing/ConvPartition.h"

namespace ulvetta {

// The settings a prepared response depends on, as the engine holds them.
struct ResponseKey {
    int32_t mode = -1;
    int32_t sampleRate = 0;  // Hz
    int32_t decay = -1;
    int32_t damping = -1;
    int32_t roomSize = -1;

    bool operator==(const ResponseKey& o) const {
        return mode == o.mode && sampleRate == o.sampleRate && decay == o.decay && damping == o.damping &&
               roomSize == o.roomSize;
    }
    bool operator!=(const ResponseKey& o) const { return !(*this == o); }
};

struct ConvolutionResponse {
    ResponseKey key;
    std::unique_ptr<float[]> irLeft, irRight;  // irLength samples each
    int32_t irLength = 0;
    HistoryRing historyLeft, historyRight;     // irLength samples each
    // Declared after the buffers its workers read: destroyed (and its workers joined) first.
    std::unique_ptr<ConvPartition[]> partitions;
    int32_t partitionCount = 0;  // records, the direct head (record 0) included

    ConvolutionResponse() = default;
    ~ConvolutionResponse() { StopWorkers(); }
    ConvolutionResponse(const ConvolutionResponse&) = delete;
    ConvolutionResponse& operator=(const ConvolutionResponse&) = delete;

    void StopWorkers();
    // Silences the convolution state (history, windows, results, play positions) and keeps the response;
    // waits for a worker still busy with a job. Allocates nothing.
    void Clear();
};

}  // namespace ulvetta
