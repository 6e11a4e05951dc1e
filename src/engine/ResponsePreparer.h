// ResponsePreparer: prepares the convolution responses, on the calling thread or on its own preparation
// thread, so that a change of Decay, Damping, Room Size, algorithm or rate never holds up the stream.
//
// Threads and ownership: the engine's owner calls Prepare, Request, Drop and WaitIdle with the core's lock
// held; the streaming thread calls only TakeReady, which never waits, allocates or frees. The preparation
// thread is started on the first Request and joined by the destructor; it takes no lock but the
// preparer's own: buildLock_ for the length of one preparation (it guards the conversion cache) and
// handoff_ only to move a pointer. A finished response waits in ready_ until the streaming thread swaps it
// for the one it plays, which goes to retired_ and is destroyed on the preparation thread. The latest
// request wins: requests that arrive during a preparation collapse into one.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <vector>

#include "engine/ConvolutionResponse.h"
#include "platform/Event.h"
#include "platform/Mutex.h"
#include "platform/Thread.h"

namespace ulvetta {

class ResponsePreparer {
public:
    ResponsePreparer() = default;
    ~ResponsePreparer();
    ResponsePreparer(const ResponsePreparer&) = delete;
    ResponsePreparer& operator=(const ResponsePreparer&) = delete;

    // Prepares the response of key on the calling thread and returns it, with workers for its large
    // partitions when startWorkers is set. Drops outstanding requests; a finished response of the same key
    // is returned instead of preparing again. Waits for a preparation in progress. Allocates.
    std::unique_ptr<ConvolutionResponse> Prepare(const ResponseKey& key, bool startWorkers);
    // Asks the preparation thread for the response of key and returns at once (starts the thread on first
    // use, which allocates). False when the thread cannot be started: the caller prepares it itself.
    bool Request(const ResponseKey& key, bool startWorkers);
    // Forgets outstanding requests and finished responses not yet taken; a preparation in progress is
    // discarded when it ends. Never waits for it.
    void Drop();
    // Destroys a response no longer played: on the preparation thread when it runs (joining the response's
    // workers can take as long as a job they are busy with), otherwise now.
    void Discard(std::unique_ptr<ConvolutionResponse> r);
    // Blocks until no request is outstanding and no preparation runs.
    void WaitIdle();

    // [streaming thread] When a finished response waits, swaps it with active and returns true; the
    // response played so far is destroyed later on the preparation thread. Never waits, allocates or frees.
    bool TakeReady(std::unique_ptr<ConvolutionResponse>& active);

private:
    // The whole preparation of one response: conversion to the rate, shortening, damping, fade, room
    // envelope, the partitions with their spectra and workers, the history rings.
    std::unique_ptr<ConvolutionResponse> PrepareImpulse(const ResponseKey& key, bool startWorkers);
    // The stored response of mode converted to rate, interleaved; converted once per mode and rate.
    const float* Converted(int mode, int32_t rate, int32_t& frames);
    void Loop();
    // Drops outstanding requests, marks a preparation in progress for discarding, and hands back a finished
    // response not yet taken.
    std::unique_ptr<ConvolutionResponse> Forget();

    Mutex buildLock_;  // held for one whole preparation; guards the conversion cache
    int32_t cachedMode_ = -1, cachedRate_ = 0, cachedFrames_ = 0;
    std::vector<float> cached_;

    Mutex handoff_;  // guards everything below; held only to move pointers and flags
    ResponseKey requested_;
    bool requestPending_ = false;
    bool requestWorkers_ = true;
    bool building_ = false;
    ResponseKey buildingKey_;          // of the preparation in progress
    uint32_t buildingGeneration_ = 0;  // generation_ when it started
    uint32_t generation_ = 0;  // raised by Prepare and Drop: a preparation started before is discarded
    std::unique_ptr<ConvolutionResponse> ready_, retired_;
    std::vector<std::unique_ptr<ConvolutionResponse>> discarded_;
    std::atomic<bool> readyFlag_{false};
    std::atomic<bool> stop_{false};
    Event wake_;  // a request, a retired response to destroy, or the stop
    Event idle_;  // a preparation ended
    std::unique_ptr<Thread> thread_;
};

}  // namespace ulvetta
