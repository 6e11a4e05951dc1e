// Preparation of a stored response for the convolution modes: conversion to the stream rate, shortening
// by "Decay", damping, fade and room envelope, the partition grid with the spectra of every partition,
// the FIR head, the history rings and the workers of the large partitions. Runs under the core's lock
// with every earlier worker stopped; allocates.
#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

#include "engine/IrResampler.h"
#include "engine/ReverbEngine.h"

namespace ulvetta {

namespace {
// Partitions of this many samples and more are transformed by their own worker thread.
constexpr int32_t kWorkerPartition = 4096;
// The workers' stack: the transforms need little, but sanitizer builds need room.
constexpr std::size_t kWorkerStack = 256 * 1024;
constexpr int kHeadTaps = 64;
}  // namespace

void ReverbEngine::StopWorkers() {
    for (int32_t i = 0; i < partitionCount && partitions; ++i) partitions[i].StopWorker();
}

void ReverbEngine::PrepareImpulse(int frames, const float* table) {
    const int32_t rate = sampleRate;
    irLength = frames;

    // 1. Conversion to the stream rate (one converter per channel over the interleaved data).
    std::vector<float> converted;
    const float* source = table;
    if (rate != 44100) {
        const int64_t capacityFrames = 2 * static_cast<int64_t>(rate) * (frames / 44100) + 64;
        converted.assign(2 * static_cast<size_t>(capacityFrames), 0.0f);
        IrResampler left, right;
        left.Setup(rate);
        right.Setup(rate);
        const int n = left.Run(converted.data(), table, frames, static_cast<int>(capacityFrames));
        right.Run(converted.data() + 1, table + 1, frames, static_cast<int>(capacityFrames));
        irLength = n;
        source = converted.data();
    }

    // 2. Shortening by "Decay": 100 keeps all of it, 0 a fifth.
    const int32_t used = static_cast<int32_t>(std::round(irLength * ((decay * 0.01 + 0.25) * 0.8)));

    // 3. The partition grid: a 64-sample head, then sizes 32, 32, 64, 64, 128, 128, ...
    int32_t count = 1, covered = kHeadTaps, step = 32;
    while (covered < used) {
        ++count;
        covered += step;
        if (count % 2 == 1) step *= 2;
    }
    irLength = std::max(covered, used);

    // 4. The response, split into channels, with a zero tail up to the grid boundary.
    irLeft.reset();
    irRight.reset();
    irLeft.reset(new float[irLength]());
    irRight.reset(new float[irLength]());
    for (int32_t i = 0; i < used; ++i) {
        irLeft[i] = source[2 * static_cast<size_t>(i)];
        irRight[i] = source[2 * static_cast<size_t>(i) + 1];
    }
    converted.clear();
    converted.shrink_to_fit();

    // 5. Damping: a one-pole low-pass over everything after the first 100 ms. Its coefficient is limited
    //    to 1.0 (no filtering), beyond which the filter would diverge at low rates.
    if (damping != 0) {
        const float a = std::min(static_cast<float>(damping * 140.0 / (rate / 2)), 1.0f);
        const int64_t i0 = std::max<int64_t>(1, static_cast<int64_t>(rate) * 4410 / 44100);
        if (i0 < irLength) {
            float yl = irLeft[i0 - 1], yr = irRight[i0 - 1];
            for (int64_t i = i0; i < irLength; ++i) {
                yl = yl + a * (irLeft[i] - yl);
                irLeft[i] = yl;
                yr = yr + a * (irRight[i] - yr);
                irRight[i] = yr;
            }
        }
    }

    // 6. Fade from the middle of the used length to nothing at its end.
    if (decay != 100) {
        const int32_t h = used / 2;
        for (int32_t i = h; i < used && h > 0; ++i) {
            const double g = 1.0 - static_cast<double>(i - h) / h;
            irLeft[i] = static_cast<float>(irLeft[i] * g);
            irRight[i] = static_cast<float>(irRight[i] * g);
        }
    }

    // 7. Room envelope: whole up to s0, down to 0.3 at s1, to nothing at the end.
    if (roomSize != 200) {
        const double r = roomSize * 0.005;
        const int32_t s0 = static_cast<int32_t>(std::round(0.25 * r * used));
        const int32_t s1 = static_cast<int32_t>(std::round(0.5 * r * used));
        for (int32_t i = s0; i < used; ++i) {
            const double g = i < s1 ? (1.0 - static_cast<double>(i - s0) / (s1 - s0)) * (1.0 - 0.3) + 0.3
                                    : (1.0 - static_cast<double>(i - s1) / (used - s1)) * 0.3;
            irLeft[i] = static_cast<float>(irLeft[i] * g);
            irRight[i] = static_cast<float>(irRight[i] * g);
        }
    }

    // 8. Partition records with the spectra of their segments (each in the second half of its block).
    partitions.reset();
    partitions.reset(new ConvPartition[count]);
    partitionCount = count;
    int32_t s = 32, order = 6, position = kHeadTaps;
    for (int32_t i = 1; i < count; ++i) {
        ConvPartition& p = partitions[i];
        p.Allocate(s, order);
        p.offset = (i % 2 == 0) ? 2 * s : s;
        std::memcpy(p.spectrumLeft.get() + s, irLeft.get() + position, sizeof(float) * s);
        std::memcpy(p.spectrumRight.get() + s, irRight.get() + position, sizeof(float) * s);
        nspsRealFftl(p.spectrumLeft.get(), order, FlagForward + FlagOutPerm);
        nspsRealFftl(p.spectrumRight.get(), order, FlagForward + FlagOutPerm);
        position += s;
        if (i % 2 == 0) {
            s *= 2;
            ++order;
        }
    }

    // 9. History rings, the FIR head, the counters.
    historyLeft.Create(irLength);
    historyRight.Create(irLength);
    nspsFirSetDlyl(nullptr, &firLeft);
    nspsFirSetDlyl(nullptr, &firRight);
    nspsFirSetTaps(irLeft.get(), &firLeft);
    nspsFirSetTaps(irRight.get(), &firRight);
    headLeft = headRight = 0.0f;

    // 10. Workers for the large partitions.
    if (!inlineLargePartitions)
        for (int32_t i = 1; i < count; ++i)
            if (partitions[i].size >= kWorkerPartition) partitions[i].StartWorker(kWorkerStack);
}

bool ReverbEngine::PreparedResponse(std::vector<float>& left, std::vector<float>& right) const {
    if (mode < 3 || mode > 5 || irLeft == nullptr || irRight == nullptr || irLength <= 0) return false;
    left.assign(irLeft.get(), irLeft.get() + irLength);
    right.assign(irRight.get(), irRight.get() + irLength);
    return true;
}

}  // namespace ulvetta
