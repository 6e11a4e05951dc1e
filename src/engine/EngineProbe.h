// Read access to the engine's private state for the tests, and the few test set-ups that reach into it
// (planting a value in a line, switching the large partitions to inline jobs). Nothing else uses it.
#pragma once

#include "engine/ReverbEngine.h"

namespace ulvetta {

class EngineProbe {
public:
    explicit EngineProbe(const ReverbEngine& e) : e_(e) {}

    // Values as the setters stored them (-1 and the like while unset).
    int32_t sampleRate() const { return e_.sampleRate; }
    int32_t mode() const { return e_.mode; }
    int32_t diffusion() const { return e_.diffusion; }
    int32_t damping() const { return e_.damping; }
    int32_t roomSize() const { return e_.roomSize; }
    double notchQ() const { return e_.notchQ; }
    double earlyGain() const { return e_.earlyGain; }
    double colourCutoff() const { return e_.colourCutoff; }
    int32_t meterSource() const { return e_.meterSource; }
    int32_t rebuildCount() const { return e_.rebuildCount; }
    bool preDelayOn() const { return e_.preDelayOn; }

    // The block processor's end-of-stream state and scratch.
    bool flushLatched() const { return e_.flushLatched; }
    bool tailTrimArmed() const { return e_.tailTrimArmed; }
    int32_t monoCapacity() const { return e_.monoCapacity; }
    // The meter smoother's coefficients b0, b1, b2, a1, a2.
    const float* meterSmoother() const { return e_.smoothCoefs; }

    // The networks and filter sections.
    const DelayLine& line(int i) const { return e_.delayLines[i]; }
    const DelayLine& earlyLine(int i) const { return e_.earlyLines[i]; }
    const PreDelayLine& preDelayLine() const { return e_.preDelayLine; }
    const BiquadSection& section(int i) const { return e_.filterSections[i]; }

    // The convolution response being played (null when none is).
    const ConvolutionResponse* response() const { return e_.response_.get(); }
    int32_t partitionCount() const { return e_.PartitionCount(); }
    const ConvPartition& partition(int i) const { return e_.response_->partitions[i]; }
    int32_t responseLength() const { return e_.response_ ? e_.response_->irLength : 0; }
    const float* responseLeft() const { return e_.response_->irLeft.get(); }
    const float* responseRight() const { return e_.response_->irRight.get(); }

    // Set-ups: write access to a line or section, and large partitions run as inline jobs on the
    // streaming thread instead of their workers (same output).
    static DelayLine& line(ReverbEngine& e, int i) { return e.delayLines[i]; }
    static PreDelayLine& preDelayLine(ReverbEngine& e) { return e.preDelayLine; }
    static BiquadSection& section(ReverbEngine& e, int i) { return e.filterSections[i]; }
    static ConvolutionResponse* response(ReverbEngine& e) { return e.response_.get(); }
    static void runLargePartitionsInline(ReverbEngine& e) { e.inlineLargePartitions = true; }

private:
    const ReverbEngine& e_;
};

}  // namespace ulvetta
