// The transform-filter base and the filter's streaming, driven in process between two stand-in pins
// whose downstream side asks for small buffers, so that one input sample spreads over several outputs.
#include <gtest/gtest.h>

#include <cmath>

#include "FilterRig.h"
#include "engine/EngineProbe.h"

using namespace ulvetta;
using namespace ulvetta::dshow;
using namespace ulvetta::test;

TEST(Streaming, OneInputSampleSpreadsOverSmallOutputBuffers) {
    Rig rig(8000, 1024);  // 256 frames per output buffer
    ASSERT_EQ(rig.Connect(), S_OK);
    const std::vector<int16_t> in = Ramp(2048);
    ASSERT_EQ(rig.Send(in, 8000, true), S_OK);
    const auto& d = rig.downstream.delivered;
    ASSERT_EQ(d.size(), 8u);
    EXPECT_TRUE(d[0].timed);
    EXPECT_EQ(d[0].start, 10000000);
    EXPECT_TRUE(d[0].discontinuity);
    for (size_t i = 1; i < d.size(); ++i) {
        EXPECT_FALSE(d[i].timed) << i;  // the continuation samples carry no times
        EXPECT_FALSE(d[i].discontinuity) << i;
    }
    EXPECT_EQ(rig.Output(), in);  // every frame once, in order
}

TEST(Streaming, DirectProcessingRunsLargeBlocksInPiecesAndClampsSixteenBitOutput) {
    FilterHolder a, b;
    auto process = [](FilterHolder& f, int mode, const std::vector<int16_t>& in) {
        std::vector<int16_t> out(in.size());
        const int frames = static_cast<int>(in.size() / 2);
        bool shortfall = true;
        EXPECT_EQ(f.filter->Control().Process(mode, reinterpret_cast<const BYTE*>(in.data()), frames,
                                              reinterpret_cast<BYTE*>(out.data()), frames, &shortfall),
                  frames);
        EXPECT_FALSE(shortfall);
        return out;
    };
    a.StartDry16(8000);
    const std::vector<int16_t> ramp = Ramp(5000);  // more than the scratch made before any allocator is known
    EXPECT_EQ(process(a, kModeDiscontinuity, ramp), ramp);

    b.StartDry16(44100);
    b.Core()->setValue(kOutputLevelDry, 60);  // +6 dB
    const double g = std::pow(10.0, 0.3);
    auto gained = [g](int v) {
        return static_cast<int16_t>(std::trunc(static_cast<float>(v / 32768.0f * g) * 32768.0));
    };
    // Clamped, never wrapped; 1.995 truncates to 1.
    EXPECT_EQ(process(b, kModeOrdinary, {32767, -32768, 100, -101, 20000, -20000, 0, 1}),
              (std::vector<int16_t>{32767, -32768, gained(100), gained(-101), 32767, -32768, 0, 1}));
}

TEST(Streaming, EndOfStreamDrainsTheTailAndPassesTheEndOn) {
    Rig rig(8000, 1024);
    ASSERT_EQ(rig.Connect(), S_OK);
    rig.holder.Core()->setValue(kOutputLevelWet, 0);  // the reverb on: a tail follows the input
    ASSERT_EQ(rig.Send(Ramp(512), 0, true), S_OK);
    const size_t before = rig.downstream.delivered.size();
    ASSERT_EQ(rig.filter->GetPin(0)->EndOfStream(), S_OK);
    EXPECT_EQ(rig.downstream.endOfStreams, 1);
    const auto& d = rig.downstream.delivered;
    ASSERT_GT(d.size(), before + 1);
    // Full buffers of tail, then one partial (or none) before the end of stream.
    for (size_t i = before; i + 1 < d.size(); ++i) EXPECT_EQ(d[i].bytes.size(), 1024u) << i;
    EXPECT_LE(d.back().bytes.size(), 1024u);
}

TEST(Streaming, PausingWithNoInputEndsTheStreamDownstreamWithoutHoldingTheStateLock) {
    Rig rig(44100, 4096);
    ASSERT_EQ(rig.filter->GetPin(0)->ReceiveConnection(&rig.upstream, rig.type), S_OK);
    ASSERT_EQ(rig.filter->GetPin(1)->Connect(&rig.downstream, nullptr), S_OK);
    ASSERT_EQ(rig.filter->GetPin(0)->Disconnect(), S_OK);
    // A downstream filter that, while it takes the end of stream, waits for another thread that sets
    // the filter's clock (which takes the state lock).
    DWORD waited = WAIT_FAILED;
    rig.downstream.onEndOfStream = [&] {
        auto setClock = [](void* f) -> DWORD { return static_cast<IBaseFilter*>(f)->SetSyncSource(nullptr); };
        HANDLE other = CreateThread(nullptr, 0, setClock, static_cast<IBaseFilter*>(rig.filter), 0, nullptr);
        waited = WaitForSingleObject(other, 5000);
        CloseHandle(other);  // a thread still blocked finishes once Pause lets go of the lock
    };
    EXPECT_EQ(rig.filter->Pause(), S_OK);
    EXPECT_EQ(rig.downstream.endOfStreams, 1);
    EXPECT_EQ(waited, WAIT_OBJECT_0);
}

TEST(Streaming, StateChangesConnectionsAndTheOfferedType) {
    Rig rig(44100, 4096);
    ASSERT_EQ(rig.Connect(), S_OK);
    EXPECT_EQ(rig.filter->Stop(), S_OK);
    // Another input format while the output is connected needs the output reconnected, which only a
    // graph can do.
    ASSERT_EQ(rig.filter->GetPin(0)->Disconnect(), S_OK);
    EXPECT_EQ(rig.filter->GetPin(0)->ReceiveConnection(&rig.upstream, WaveType(WAVE_FORMAT_PCM, 2, 48000, 16)),
              VFW_E_NOT_IN_GRAPH);
    EXPECT_EQ(rig.filter->GetPin(1)->Disconnect(), S_OK);

    // The offered output type is a copy of the input's, made stereo: an extensible input keeps its tag
    // and its whole format block, with cbSize 0.
    WaveType ext(0, 2, 48000, 32, true, MEDIASUBTYPE_IEEE_FLOAT);
    ext.wf.Format.nBlockAlign = 0;  // not examined by the input, recomputed in the offer
    ext.wf.Format.nAvgBytesPerSec = 0;
    ASSERT_EQ(rig.filter->GetPin(0)->ReceiveConnection(&rig.upstream, ext), S_OK);
    AM_MEDIA_TYPE offered{};
    ASSERT_EQ(rig.filter->GetMediaType(0, &offered), S_OK);
    ASSERT_EQ(offered.cbFormat, sizeof(WAVEFORMATEXTENSIBLE));
    const auto* w = reinterpret_cast<const WAVEFORMATEXTENSIBLE*>(offered.pbFormat);
    EXPECT_EQ(offered.subtype, MEDIASUBTYPE_IEEE_FLOAT);
    EXPECT_EQ(w->Format.wFormatTag, WAVE_FORMAT_EXTENSIBLE);
    EXPECT_EQ(w->Format.cbSize, 0);
    EXPECT_EQ(w->Format.nBlockAlign, 8);
    EXPECT_EQ(w->Format.nAvgBytesPerSec, 384000u);
    EXPECT_EQ(w->SubFormat, MEDIASUBTYPE_IEEE_FLOAT);
    FreeMediaType(offered);
    EXPECT_EQ(rig.filter->GetMediaType(1, &offered), VFW_S_NO_MORE_ITEMS);
    // The copy is taken downstream and the stream runs as float.
    ASSERT_EQ(rig.filter->GetPin(1)->Connect(&rig.downstream, nullptr), S_OK);
    EXPECT_EQ(EngineProbe(rig.filter->Control().GetCore()->engineForInspection()).sampleRate(), 48000);
}
