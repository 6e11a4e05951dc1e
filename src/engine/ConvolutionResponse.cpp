#include "engine/ConvolutionResponse.h"

namespace ulvetta {

void ConvolutionResponse::StopWorkers() {
    for (int32_t i = 0; i < partitionCount && partitions; ++i) partitions[i].StopWorker();
}

void ConvolutionResponse::Clear() {
    historyLeft.Zero();
    historyRight.Zero();
    for (int32_t i = 1; i < partitionCount && partitions; ++i) partitions[i].Clear();
}

}  // namespace ulvetta
