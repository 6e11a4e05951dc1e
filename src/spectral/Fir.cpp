// The single-rate FIR filter: a window of the last tapsLen inputs slides through a buffer with room for
// `spare` more samples and is moved back to the buffer's start when it reaches windowEnd.
#include <algorithm>
#include <cstring>

#include "spectral/FftTables.h"
#include "spectral/Nsp.h"
#include "spectral/NspContext.h"

namespace ulvetta {

namespace {

using spectral::report;

bool checkState(const FirState* state, const char* routine) {
    if (!state) {
        report(NspStsBadArg, routine, "Null state pointer");
        return false;
    }
    if (state->initMarker != state) {
        report(NspStsBadArg, routine, "Must have been initialized");
        return false;
    }
    return true;
}

void freeBuffers(FirState* state) {
    spectral::alignedFree(state->taps);
    spectral::alignedFree(state->buffer);
    *state = FirState{};
}

}  // namespace

int nspsFirInit(const float* taps, int tapsLen, const float* dlyVals, FirState* state) {
    const char* fn = "nspsFirInit";
    if (!state) {
        report(NspStsBadArg, fn, "Null state pointer");
        return 0;
    }
    if (tapsLen < 1) {
        report(NspStsBadArg, fn, "Invalid value");
        return 0;
    }
    if (state->initMarker == state) freeBuffers(state);
    *state = FirState{};

    const std::size_t len = static_cast<std::size_t>(tapsLen);
    const std::size_t dlyLen = len - 1;
    const std::size_t spare = std::max<std::size_t>(dlyLen, 127) + 1;
    state->taps = static_cast<float*>(spectral::alignedAlloc(len * sizeof(float)));
    state->buffer = static_cast<float*>(spectral::alignedAlloc((dlyLen + spare) * sizeof(float)));
    if (!state->taps || !state->buffer) {
        freeBuffers(state);
        report(NspStsNoMem, fn, "Allocation failure");
        return 0;
    }
    std::memset(state->buffer, 0, (dlyLen + spare) * sizeof(float));
    state->upFactor = 1;
    state->upPhase = 0;
    state->downFactor = 1;
    state->downPhase = 0;
    state->isMultiRate = 0;
    state->tapsLen = tapsLen;
    state->tapsLen8 = tapsLen & ~7;
    state->dlyLen = static_cast<std::int32_t>(dlyLen);
    state->spare = static_cast<std::int32_t>(spare);
    state->windowEnd = state->buffer + spare;
    state->window = state->buffer;
    state->phaseTable = nullptr;
    state->initMarker = state;
    nspsFirSetTaps(taps, state);
    nspsFirSetDlyl(dlyVals, state);
    return 1;
}

void nspsFirSetTaps(const float* taps, FirState* state) {
    if (!checkState(state, "nspsFirSetTaps")) return;
    const int len = state->tapsLen;
    for (int i = 0; i < len; ++i) state->taps[i] = taps ? taps[len - 1 - i] : 0.0f;
}

void nspsFirSetDlyl(const float* dly, FirState* state) {
    if (!checkState(state, "nspsFirSetDlyl")) return;
    for (int i = 0; i < state->dlyLen; ++i) state->window[i] = dly ? dly[i] : 0.0f;
}

float nspsFir(FirState* state, float sample) {
    if (!checkState(state, "nspsFir")) return 0.0f;
    float* w = state->window;
    const float* h = state->taps;
    w[state->dlyLen] = sample;
    // Each product of two floats is exact in double. Eight running sums (so the additions need not wait on
    // each other) up to tapsLen8, then the rest; the total is rounded to float once.
    double y = spectral::activeKernels().dot8(h, w, std::size_t(state->tapsLen8));
    for (int i = state->tapsLen8; i < state->tapsLen; ++i) y += double(h[i]) * w[i];
    ++state->window;
    if (state->window == state->windowEnd) {
        std::memmove(state->buffer, state->windowEnd, std::size_t(state->dlyLen) * sizeof(float));
        state->window = state->buffer;
    }
    return static_cast<float>(y);
}

void nspFirFree(FirState* state) {
    if (!checkState(state, "nspFirnspFree")) return;
    freeBuffers(state);
}

}  // namespace ulvetta
