// Passes the rendered frames to the output and ends the reverb tail early: once the input has ended
// and the output has stayed below a level for a whole second, the output stops after its last frame
// at or above that level, never before the input's own length.
#pragma once

#include <cmath>
#include <vector>

#include "AudioOutput.h"

namespace ulvetta {

class TailCut {
public:
    // threshold: linear level (|sample| below it on both channels is quiet); 0 keeps every frame, so
    // that the tail runs until the core ends it. quietFrames: the quiet stretch that ends the output.
    TailCut(AudioOutput& output, double threshold, long long quietFrames, int blockFrames);

    // Frames that correspond to input: always written.
    void addInput(const float* interleaved, int frames);
    // Tail frames: written, or held back while quiet. Returns true once the output has ended; the
    // frames held back are then dropped.
    bool addTail(const float* interleaved, int frames);
    // The core ended the tail first: writes what is held back.
    void finish();

private:
    bool loud(const float* frame) const {
        return !(std::fabs(double(frame[0])) < threshold_ && std::fabs(double(frame[1])) < threshold_);
    }

    AudioOutput& output_;
    double threshold_;
    long long quietFrames_;
    long long frame_ = 0;      // frames seen
    long long lastLoud_ = -1;  // the last frame at or above the threshold
    std::vector<float> held_;  // quiet tail frames after lastLoud_, interleaved
};

}  // namespace ulvetta
