// ConvPartition: one partition of the convolution reverb's response: its spectra, its input window, its
// transform work space and its results, and, for partitions of 4096 samples or more, the worker thread
// that transforms it.
//
// Thread contract: the streaming thread writes the input window and reads the next result only after
// doneEvent; the worker writes work and next only after workEvent, then signals doneEvent. The output
// being played belongs to the streaming thread alone. StopWorker joins the thread, so a partition's
// buffers may be freed right after it returns; the destructor stops a running worker first.
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "platform/Event.h"
#include "platform/Thread.h"

namespace ulvetta {

// A ring of float input history, one per channel.
struct HistoryRing {
    int32_t count = 0;
    std::unique_ptr<float[]> storage;
    float* write = nullptr;  // where the next sample goes
    float* start = nullptr;
    float* end = nullptr;    // one past the last sample

    // count zeroed samples, the write position at the start (allocates).
    void Create(int32_t n);
    void Zero();
    void Push(float v) {
        *write = v;
        if (++write == end) write = start;
    }
    // Copies count samples, oldest first, starting with the one pushed `age` samples before the newest.
    void CopyOut(int32_t age, int32_t count_, float* dst) const;
};

struct ConvPartition {
    int32_t size = 0;     // response samples covered
    int32_t offset = 0;   // distance from the head as the kernel schedules it
    int32_t fftOrder = 0; // 2^fftOrder = 2 x size
    std::unique_ptr<float[]> inputLeft, inputRight;        // 2 x size: the window, older half first
    std::unique_ptr<float[]> workLeft, workRight;          // 4 x size: transform work space
    std::unique_ptr<float[]> outputLeft, outputRight;      // size: the result being played
    std::unique_ptr<float[]> nextLeft, nextRight;          // size: the latest result, waiting
    std::unique_ptr<float[]> spectrumLeft, spectrumRight;  // 4 x size: the segment's spectrum (first 2 x size)
    int32_t readPos = 0;

    ConvPartition() = default;
    ~ConvPartition();
    ConvPartition(const ConvPartition&) = delete;
    ConvPartition& operator=(const ConvPartition&) = delete;

    // Allocates the buffers of a partition of s samples and transform order o: window and results zeroed,
    // the first half of each spectrum zeroed (the segment goes into it), the work space left unset.
    void Allocate(int32_t s, int32_t o);
    // Transforms the window and multiplies by the segment's spectrum; the first size values of the inverse
    // become the next result (both channels).
    void RunJob();
    // Zeroes the window, the results and the play position, keeping the spectra; first waits for a job the
    // worker still runs. Allocates nothing.
    void Clear();

    // Starts the worker with its two events; it signals doneEvent once at start.
    bool StartWorker(std::size_t stackBytes);
    // Raises the stop flag, wakes the worker and waits for it to end. Harmless when none runs.
    void StopWorker();
    bool HasWorker() const { return thread_ && thread_->running(); }
    // Hand-off from the streaming thread: wait until the worker is idle / start its job.
    void WaitDone() { doneEvent_->wait(); }
    void StartJob() { workEvent_->set(); }

private:
    void WorkerLoop();

    std::unique_ptr<Thread> thread_;
    std::atomic<bool> stop_{false};
    std::unique_ptr<Event> workEvent_, doneEvent_;
};

}  // namespace ulvetta
