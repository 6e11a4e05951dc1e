#include "TailCut.h"

namespace ulvetta {

TailCut::TailCut(AudioOutput& output, double threshold, long long quietFrames, int blockFrames)
    : output_(output), threshold_(threshold), quietFrames_(quietFrames) {
    // Up to a quiet second and one block are held at a time.
    if (threshold_ > 0.0) held_.reserve(2 * (static_cast<size_t>(quietFrames) + static_cast<size_t>(blockFrames)));
}

void TailCut::addInput(const float* interleaved, int frames) {
    if (threshold_ > 0.0)
        for (int i = 0; i < frames; ++i)
            if (loud(interleaved + 2 * i)) lastLoud_ = frame_ + i;
    frame_ += frames;
    output_.write(interleaved, frames);
}

bool TailCut::addTail(const float* interleaved, int frames) {
    if (threshold_ <= 0.0) {
        output_.write(interleaved, frames);
        return false;
    }
    int kept = 0;  // frames of this block up to its last loud one
    int seen = 0;
    bool ended = false;
    for (; seen < frames; ++seen, ++frame_) {
        if (frame_ - 1 - lastLoud_ >= quietFrames_) {
            ended = true;
            break;
        }
        if (loud(interleaved + 2 * seen)) {
            lastLoud_ = frame_;
            kept = seen + 1;
        }
    }
    if (kept > 0) {
        output_.write(held_.data(), static_cast<long long>(held_.size() / 2));
        held_.clear();
        output_.write(interleaved, kept);
    }
    if (ended)
        held_.clear();
    else
        held_.insert(held_.end(), interleaved + 2 * kept, interleaved + 2 * seen);
    return ended;
}

void TailCut::finish() {
    output_.write(held_.data(), static_cast<long long>(held_.size() / 2));
    held_.clear();
}

}  // namespace ulvetta
