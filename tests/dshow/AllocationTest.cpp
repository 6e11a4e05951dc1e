// The filter's allocations, counted with a replaced global operator new: the streaming path allocates
// nothing once started, and an allocation that fails anywhere in a COM call gives an error code, leaks
// nothing and leaves a filter that still processes.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <functional>
#include <malloc.h>  // _aligned_malloc
#include <new>

#include "FilterRig.h"
#include "filter/CoreState.h"

using namespace ulvetta;
using namespace ulvetta::dshow;
using namespace ulvetta::test;

namespace {

std::atomic<long> g_live{0};  // allocations not yet freed, all threads
thread_local long t_count = 0;     // allocations on this thread since counting started
thread_local long t_failAt = 0;    // the allocation of this thread that fails (1-based); 0 for none
thread_local bool t_failed = false;

void* Allocate(size_t n, size_t align) {
    if (t_failAt > 0 && ++t_count == t_failAt) {
        t_failed = true;
        throw std::bad_alloc();
    }
    if (t_failAt == 0) ++t_count;
    void* p = align ? _aligned_malloc(n ? n : 1, align) : std::malloc(n ? n : 1);
    if (p == nullptr) throw std::bad_alloc();
    ++g_live;
    return p;
}

void Free(void* p, bool aligned) {
    if (p == nullptr) return;
    --g_live;
    aligned ? _aligned_free(p) : std::free(p);
}

}  // namespace

void* operator new(size_t n) { return Allocate(n, 0); }
void* operator new(size_t n, std::align_val_t a) { return Allocate(n, static_cast<size_t>(a)); }
void operator delete(void* p) noexcept { Free(p, false); }
void operator delete(void* p, size_t) noexcept { Free(p, false); }
void operator delete(void* p, std::align_val_t) noexcept { Free(p, true); }
void operator delete(void* p, size_t, std::align_val_t) noexcept { Free(p, true); }

namespace {

MP_ENVELOPE_SEGMENT Ramp8000(int64_t fromFrame, int64_t toFrame) {
    MP_ENVELOPE_SEGMENT seg{};
    seg.rtStart = fromFrame * 10000000 / 8000;
    seg.rtEnd = toFrame * 10000000 / 8000;
    seg.valStart = 0.2f;
    seg.valEnd = 0.9f;
    seg.iCurve = MP_CURVE_LINEAR;
    return seg;
}

}  // namespace

TEST(Allocation, StreamingAndParameterAccessAllocateNothingOnceStarted) {
    for (bool pcm16 : {true, false}) {
        SCOPED_TRACE(pcm16 ? "16-bit" : "float");
        Rig rig(8000, 1 << 14, pcm16);
        ASSERT_EQ(rig.Connect(), S_OK);
        rig.downstream.recording = false;
        rig.holder.Core()->setValue(kOutputLevelWet, 0);
        auto params = rig.holder.As<IMediaParams>();
        MP_ENVELOPE_SEGMENT seg = Ramp8000(4096, 8000 * 60);  // active through every counted block
        ASSERT_EQ(params->AddEnvelope(kOutputLevelDry, 1, &seg), S_OK);
        // The allowed exception: the core's mono buffer grows to the largest block it is handed, here a
        // whole output buffer (as the tail drain hands it) before the envelope starts.
        ASSERT_EQ(pcm16 ? rig.Send(Ramp(4096), 0, true) : rig.Send(std::vector<float>(8192, 0.25f), 0, true), S_OK);
        const std::vector<int16_t> pcm = Ramp(1000);
        const std::vector<float> flt(2000, 0.25f);
        HRESULT hr = S_OK;
        MP_DATA value = 0;
        t_count = 0;  // allocations on this thread from here on
        for (int64_t at = 4096; at < 40000 && hr == S_OK; at += 1000)
            hr = pcm16 ? rig.Send(pcm, at, false) : rig.Send(flt, at, false);
        if (hr == S_OK) hr = params->SetParam(kOutputLevelWet, 0.5f);  // no network rebuild
        if (hr == S_OK) hr = params->GetParam(kOutputLevelWet, &value);
        if (hr == S_OK) hr = rig.filter->GetPin(0)->EndOfStream();
        EXPECT_EQ(hr, S_OK);
        EXPECT_EQ(t_count, 0);
        EXPECT_EQ(rig.downstream.endOfStreams, 1);
    }
}

namespace {

struct FaultCase {
    const char* name;
    std::function<HRESULT(Rig&)> call;  // the call under test, made on a connected filter
    // Connecting tries further media types after a failure and then reports that none was acceptable;
    // every other call reports the failed allocation itself. The rig is left unconnected for it.
    bool connects = false;
    bool envelope = false;  // the decay automated beforehand
};

std::vector<uint8_t> SavedState() {
    ReverbCore core;
    core.setValue(kAlgorithm, 5);  // a network of another size
    core.setValue(kRoomSize, 80);
    std::vector<uint8_t> state(kCoreStateSize);
    core.saveState(state.data());
    return state;
}

}  // namespace

TEST(Allocation, EveryFailedAllocationGivesAnErrorLeaksNothingAndTheFilterStillProcesses) {
    const std::vector<uint8_t> state = SavedState();
    MP_ENVELOPE_SEGMENT seg = Ramp8000(0, 4000);
    const std::vector<int16_t> block = Ramp(1000);  // made here: the calls under test allocate alone
    const FaultCase cases[] = {
        {"Load", [&](Rig& r) { return r.holder.As<IPersistStream>()->Load(StreamOf(state).get()); }},
        {"Save", [](Rig& r) { return r.holder.As<IPersistStream>()->Save(StreamOf({}).get(), TRUE); }},
        {"Connect", [](Rig& r) { return r.Connect(); }, true},
        {"AddEnvelope", [&](Rig& r) { return r.holder.As<IMediaParams>()->AddEnvelope(kAllParams, 1, &seg); }},
        {"Receive", [&](Rig& r) { return r.Send(block, 0, true); }, false, true},
        {"SetParam", [](Rig& r) { return r.holder.As<IMediaParams>()->SetParam(kRoomSize, 0.9f); }},
    };
    {  // one-time set-up of the process (COM, the allocators' classes) stays allocated
        Rig warm(8000, 4096);
        warm.Connect();
        warm.Send(Ramp(100), 0, true);
    }
    for (const FaultCase& c : cases) {
        SCOPED_TRACE(c.name);
        for (long n = 1;; ++n) {
            const long liveBefore = g_live;
            bool failed;
            {
                Rig rig(8000, 4096);
                rig.downstream.recording = false;
                ASSERT_EQ(c.connects ? S_OK : rig.Connect(), S_OK);
                ASSERT_EQ(c.envelope ? rig.holder.As<IMediaParams>()->AddEnvelope(kDecay, 1, &seg) : S_OK, S_OK);
                t_count = 0;
                t_failAt = n;
                t_failed = false;
                const HRESULT hr = c.call(rig);
                t_failAt = 0;
                failed = t_failed;
                // A call may succeed when the allocation that failed was optional; then it did all its work.
                if (!failed) {
                    EXPECT_EQ(hr, S_OK);
                } else if (!c.connects) {
                    EXPECT_TRUE(hr == E_OUTOFMEMORY || hr == S_OK) << hr << " at " << n;
                } else if (FAILED(hr)) {
                    ASSERT_EQ(rig.Reconnect(), S_OK) << "allocation " << n;
                }
                // Still usable: processing.
                rig.downstream.recording = true;
                ASSERT_EQ(rig.Send(Ramp(500), 4000, true), S_OK) << "allocation " << n;
                EXPECT_EQ(rig.Output().size(), 1000u) << "allocation " << n;
            }
            EXPECT_EQ(g_live, liveBefore) << "allocation " << n;
            if (!failed) break;  // the call made fewer than n allocations: each of them has failed once
        }
    }
}
