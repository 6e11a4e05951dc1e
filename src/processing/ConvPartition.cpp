#include "processing/ConvPartition.h"

#include <algorithm>
#include <cstring>

#include "spectral/Nsp.h"

namespace ulvetta {

void HistoryRing::Create(int32_t n) {
    storage.reset();
    storage.reset(new float[n]());
    count = n;
    start = storage.get();
    end = start + n;
    write = start;
}

void HistoryRing::Zero() {
    if (storage) std::fill(start, end, 0.0f);
    write = start;
}

void HistoryRing::CopyOut(int32_t age, int32_t n, float* dst) const {
    int32_t from = static_cast<int32_t>(write - start) - 1 - age;
    if (from < 0) from += count;
    const int32_t first = std::min(n, count - from);
    std::copy(start + from, start + from + first, dst);
    std::copy(start, start + (n - first), dst + first);
}

ConvPartition::~ConvPartition() { StopWorker(); }

void ConvPartition::Allocate(int32_t s, int32_t o) {
    size = s;
    fftOrder = o;
    for (auto* p : {&inputLeft, &inputRight}) p->reset(new float[2 * static_cast<size_t>(s)]());
    // The transforms write the work space before they read it, and use the first half of it and of the
    // spectrum buffer; only that half of the spectrum is zeroed (its segment is copied in later).
    for (auto* p : {&workLeft, &workRight}) p->reset(new float[4 * static_cast<size_t>(s)]);
    for (auto* p : {&spectrumLeft, &spectrumRight}) {
        p->reset(new float[4 * static_cast<size_t>(s)]);
        std::fill(p->get(), p->get() + 2 * static_cast<size_t>(s), 0.0f);
    }
    for (auto* p : {&outputLeft, &outputRight, &nextLeft, &nextRight}) p->reset(new float[s]());
}

void ConvPartition::RunJob() {
    const float* inputs[2] = {inputLeft.get(), inputRight.get()};
    float* works[2] = {workLeft.get(), workRight.get()};
    const float* spectra[2] = {spectrumLeft.get(), spectrumRight.get()};
    float* nexts[2] = {nextLeft.get(), nextRight.get()};
    for (int c = 0; c < 2; ++c) {
        nspsRealFftlNip(inputs[c], works[c], fftOrder, FlagForward + FlagOutPerm);
        nspsMpyRCPerm2(spectra[c], works[c], fftOrder);
        nspsCcsFftl(works[c], fftOrder, FlagInverse + FlagInPerm);
        // The segment sits in the second half of its block, so these values have no wrap-around terms.
        std::memcpy(nexts[c], works[c], sizeof(float) * size);
    }
}

void ConvPartition::Clear() {
    const bool worker = HasWorker();
    if (worker) WaitDone();
    for (auto* p : {&inputLeft, &inputRight}) std::fill(p->get(), p->get() + 2 * static_cast<size_t>(size), 0.0f);
    for (auto* p : {&outputLeft, &outputRight, &nextLeft, &nextRight}) std::fill(p->get(), p->get() + size, 0.0f);
    readPos = 0;
    if (worker) doneEvent_->set();  // the next hand-off finds the worker idle, as after its start
}

bool ConvPartition::StartWorker(std::size_t stackBytes) {
    StopWorker();
    workEvent_.reset(new Event);
    doneEvent_.reset(new Event);
    stop_ = false;
    thread_.reset(new Thread);
    return thread_->start([this] { WorkerLoop(); }, stackBytes);
}

void ConvPartition::StopWorker() {
    if (!thread_) return;
    stop_ = true;
    workEvent_->set();
    thread_->join();
    thread_.reset();
}

void ConvPartition::WorkerLoop() {
    doneEvent_->set();  // the first hand-off need not wait
    for (;;) {
        workEvent_->wait();
        if (stop_) break;
        RunJob();
        doneEvent_->set();
    }
}

}  // namespace ulvetta
