// ReverbEngine holds everything the reverb needs between audio blocks: parameter values and the
// coefficients derived from them, the delay networks, the input filter sections and the meter smoother.
//
// Threading: every operation is called with the owning core's lock held; the engine has no lock of its
// own. Lifecycle vocabulary: the setters, Recalculate and ResetState may allocate (network sizing);
// ProcessBlock never allocates except to grow the mono scratch buffer to a larger block than any before.
//
// The convolution response is prepared once per change: within BeginChanges/EndChanges the setters only
// mark it stale and EndChanges prepares it. While streaming it is prepared on the preparer's thread and
// switched in at the start of a block (the response played until then stays in use); otherwise, and
// always in ResetState, on the calling thread before it returns.
//
// Values that arrive through setters start outside their ranges (-1, -1.0, -100000.0): the first setting
// of each always counts as a change, and rebuilds do nothing while a value they need is still unset.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "engine/ConvolutionResponse.h"
#include "engine/ResponsePreparer.h"
#include "processing/BiquadSection.h"
#include "processing/DelayLine.h"
#include "spectral/Nsp.h"

namespace ulvetta {

// The object whose meter value the block processor raises and decays (the effect core).
struct LevelOwner {
    float level = 0.0f;  // peak meter value, linear
};

// How the end of the stream is detected: by the pre-delay line falling silent when it is in the path
// (always, only while "Pre Delay" is on, or never), or by counting out the convolution's response.
enum class EndOfStream { PreDelayAlways, PreDelayWhenOn, PreDelayNever, ResponseLength };
// What the input stage makes of the block before the kernel runs: nothing (the kernel reads the input
// itself), the mono sum through the filter sections, or both channels through them.
enum class InputStage { None, Mono, Stereo };

// How a kernel's block differs from the others', read by the block driver at compile time.
struct BlockPolicy {
    bool meterBeforeLatch;    // meter decay and input meter before the end-of-stream latch
    EndOfStream end;          // what holds the tail open once the stream has ended
    InputStage input;         // the input stage the driver runs before the kernel's frames
    bool flushNetworkStates;  // colour and damping states cleaned after the block
};

// The convolution modes (3, 4 and 5) play a prepared response; the others run delay networks.
inline bool IsConvolution(int32_t mode) { return mode >= 3 && mode <= 5; }

class ReverbEngine {
public:
    static constexpr int32_t kMaxSampleRate = 768000;  // Hz; the highest rate a host may give
    static constexpr int kNetworkLines = 24;
    static constexpr int kEarlyLines = 6;
    static constexpr int kOutputTaps = 20;
    static constexpr int kFilterSections = 6;

    ReverbEngine();
    virtual ~ReverbEngine();
    ReverbEngine(const ReverbEngine&) = delete;
    ReverbEngine& operator=(const ReverbEngine&) = delete;

    // Parameter setters, in parameter-id order (levels arrive as linear gains, notch gain in dB,
    // notch Q already scaled to 0.1..5.0).
    void SetDiffusion(int v);
    void SetPreDelay(int ms);
    void SetDecay(int v);
    void SetDamping(int v);
    void SetRoomSize(int v);
    void SetEarlyLevel(double g);
    void SetWetLevel(double g);
    void SetDryLevel(double g);
    void SetColour(int v);
    void SetInputGain(int tenthsDb);
    void SetLowPassFreq(int hz);
    void SetHighPassFreq(int hz);
    void SetNotchFreq(int hz);
    void SetNotchGain(double db);
    void SetNotchQ(double q);
    void SetMode(int m);

    // Stores the stream rate and designs the meter smoother; a rate outside 1..kMaxSampleRate is ignored.
    // A rate other than the one held also marks
    // "Pre Delay" and "Notch Freq" unset, so the setters that follow derive them again for the new rate.
    void SetSampleRate(int rate);
    // Rebuilds the network of the current mode (allocates).
    void Recalculate();
    // Redesigns the notch sections once frequency, Q and gain are all set.
    void UpdateNotch();
    // Rebuilds and silences the engine at stream start.
    void ResetState();
    // Brackets a group of setter calls: the convolution response they make stale is prepared once, by the
    // outermost EndChanges (nestable).
    void BeginChanges() { ++batchDepth_; }
    void EndChanges();
    // While streaming, responses are prepared off the calling thread and switched in by a later block.
    void SetStreaming(bool on) { asyncPreparation_ = on; }
    // Waits until no response is being prepared off the calling thread; the next block switches in what
    // was prepared. For tests and hosts that render offline.
    void WaitForPreparation() { preparer_.WaitIdle(); }
    // Forgets that the stream had ended (the flush latch and the tail trimming), keeping the sound: a
    // seek after the end of a stream plays on without its blocks being trimmed.
    void ClearEndOfStream();

    // Processes one block of stereo float audio; returns the number of output frames that carry signal.
    // In and out are separate channel pointers with a common stride in samples.
    int ProcessBlock(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                     int stride, int accumulate, int flush);

    // The object whose level the meters raise and decay (nullptr: no meter).
    void SetOwner(LevelOwner* o) { owner = o; }
    // The level meter's source: 0 input, 1 output, 2 wet.
    void SetMeterSource(int source) { meterSource = source; }
    // Records of the prepared convolution response, the direct head included (0 when none is prepared).
    int32_t PartitionCount() const { return response_ ? response_->partitionCount : 0; }
    // Copies the prepared convolution response (one vector per channel, at the stream rate); false when the
    // current mode is not a convolution or no response is prepared. Allocates.
    bool PreparedResponse(std::vector<float>& left, std::vector<float>& right) const;

private:
    friend class EngineProbe;  // the tests' read access
    // The kernels' shared pieces outside the class (engine/kernels/PlateNetwork.h).
    friend struct PlateInput;
    friend struct NetworkViews;
    friend bool NetworkReady(const ReverbEngine& e, int lineCount, int tapCount, bool early);

    // Fields, in declaration order.
    LevelOwner* owner = nullptr;
    int32_t sampleRate = 0;
    int32_t mode = -1;
    int32_t diffusion = -1;
    int32_t preDelay = -1;
    int32_t decay = -1;
    int32_t damping = -1;
    int32_t roomSize = -1;
    double earlyLevel = -100000.0;
    double wetLevel = -100000.0;
    double dryLevel = -100000.0;
    int32_t colour = -1;
    int32_t lowPassFreq = -1;
    int32_t highPassFreq = -1;
    double notchQ = -1.0;
    double notchGain = -100000.0;
    int32_t notchFreq = -1;
    double inputGain = 1.0;
    bool preDelayOn = false;
    double wetGain = 0.0;
    double dryGain = 0.0;
    double diffusionCoef = 0.0;
    double decayCoef = 0.0;
    double colourCutoff = 1.0;
    double colourState = 0.0;
    double colourState2 = 0.0;
    double dampingCoef = 0.0;
    double dampingStateLeft = 0.0;
    double dampingStateRight = 0.0;
    double earlyGain = 0.0;
    double echoFeedback = 0.0;
    OutputTap outputTaps[kOutputTaps];
    DelayLine delayLines[kNetworkLines];
    BiquadSection filterSections[kFilterSections];
    DelayLine earlyLines[kEarlyLines];
    PreDelayLine preDelayLine;
    std::unique_ptr<float[]> monoBuffer;
    int32_t monoCapacity = 0;  // floats: one per frame (mono), two per frame in the stereo echo
    bool flushLatched = false;
    bool tailTrimArmed = false;
    float smoothCoefs[5] = {0, 0, 0, 0, 0};  // b0, b1, b2, a1, a2
    float smoothState[4] = {0, 0, 0, 0};     // x1, x2, y1, y2
    int32_t meterSource = 0;                 // 0 input, 1 output, 2 wet
    float headLeft = 0.0f, headRight = 0.0f;     // latest outputs of the direct FIR head
    double partSumLeft[32] = {}, partSumRight[32] = {};  // the partitions' output for the current 32 frames
    FirState firLeft, firRight;                  // the response's first 64 samples, applied directly
    int32_t convCounter = 0;
    int32_t tailCountdown = 0;  // frames of convolution tail still owed after the first flush block
    // Run the jobs of large partitions on the streaming thread instead of their workers (for tests;
    // the output is the same).
    bool inlineLargePartitions = false;
    // The convolution response being played (null when none is prepared), and its preparation.
    std::unique_ptr<ConvolutionResponse> response_;
    ResponsePreparer preparer_;
    bool asyncPreparation_ = false;
    int32_t batchDepth_ = 0;
    bool responseStale_ = false;  // a setter changed what the response depends on, inside a batch

    // Number of rebuilds that got past the unset-value guard (for tests and diagnostics).
    int32_t rebuildCount = 0;

    // The settings the current mode's response depends on.
    ResponseKey WantedResponse() const { return {mode, sampleRate, decay, damping, roomSize}; }
    // Brings the response up to date with the settings: on this thread, or (when allowed and streaming)
    // by a request to the preparer.
    void CommitResponse(bool mayDefer);
    // Starts playing a freshly prepared response: its direct head, a silent history, the counter at 0.
    void InstallResponse(std::unique_ptr<ConvolutionResponse> r);
    // The part of installing that the streaming thread does when it switches a response in (no allocation).
    void StartResponse();
    // Forgets the response and anything being prepared (a delay-network mode is selected).
    void DropResponse();
    // Zeroes every state the networks and the convolution recirculate, after a non-finite value got in.
    void SilenceNetworks();

    // The highest frequency a filter design receives: just under half the rate, so that a section
    // stays stable at any rate while the parameter keeps the value the user set.
    int designLimit(int hz) const;

    using KernelFrames = void (ReverbEngine::*)(float* outLeft, float* outRight, const float* inLeft,
                                                const float* inRight, int frames, int stride, int accumulate);
    template <const BlockPolicy& kPolicy, KernelFrames kFrames>
    int RunBlock(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames, int stride,
                 int accumulate, int flush);

    // Pieces of the block frame, called by RunBlock.
    void latchEndOfStream(int flush, EndOfStream rule);
    void decayMeter(int frames);
    void meterInput(const float* inLeft, const float* inRight, int frames, int stride);
    void meterBlockInput(const float* inLeft, const float* inRight, int frames, int stride) {
        decayMeter(frames);
        if (meterSource == 0) meterInput(inLeft, inRight, frames, stride);
    }
    void makeMono(const float* inLeft, const float* inRight, int frames, int stride);
    void filterMono(int frames);
    // Both channels with the input gain, interleaved in the scratch buffer.
    void makeStereo(const float* inLeft, const float* inRight, int frames, int stride);
    void filterStereo(float* frames, int count);
    // Mixes one frame with the given wet and dry gains (the convolution kernel uses the levels, the others
    // the gains) and runs the wet or the output meter into meterPeak_ when it is the meter's source.
    void mixOutput(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frame,
                   int stride, int accumulate, double wetLeft, double wetRight, double wet, double dry);
    ULVETTA_ALWAYS_INLINE void mixOutput(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                                         int frame, int stride, int accumulate, double wetLeft, double wetRight) {
        mixOutput(outLeft, outRight, inLeft, inRight, frame, stride, accumulate, wetLeft, wetRight, wetGain, dryGain);
    }
    // Starts a block's wet or output meter; finishMeter raises the level to its peak after the block.
    void startMeter() { meterPeak_ = 0.0f; }
    void finishMeter();
    void flushKernelStates();
    // Frames of the block that carry signal: all of them until the trim is armed, then up to the last frame
    // above -313 dB.
    int trimmedLength(const float* outLeft, const float* outRight, int frames, int stride) const;
    // The convolution's count: all frames until the end of the stream, then what remains of the response.
    int countedLength(int frames, int flush);

    // Meter smoothing: one sample through the smoother, returning its output.
    float smooth(float v);
    void raiseLevel(float peak);
    void cleanSmoothState();

    // Grows the scratch buffer to hold at least count floats; returns it.
    float* growScratch(int32_t count);

    // The kernels: one block each, inside the block frame (input stage, mix, meters, tail trimming).
    // processDry runs the frame with a silent wet signal, for a mode whose network does not exist (yet).
    int processPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                     int stride, int accumulate, int flush);
    int processExtendedPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight,
                             int frames, int stride, int accumulate, int flush);
    int processEcho(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                    int stride, int accumulate, int flush);
    int processDry(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                   int stride, int accumulate, int flush);
    // The delay-network kernels' loops, compiled for what they know of their lines' modulation.
    template <Reads kDiffusers, Reads kTank>
    int runPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames, int stride,
                 int accumulate, int flush);
    template <Reads kReads>
    int runExtendedPlate(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                         int stride, int accumulate, int flush);
    template <Reads kReads>
    int runEcho(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames, int stride,
                int accumulate, int flush);
    int processConvolution(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                           int stride, int accumulate, int flush);
    // The kernels' frames, run by RunBlock between the input stage and the block's meter.
    template <Reads kDiffusers, Reads kTank>
    void plateFrames(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                     int stride, int accumulate);
    template <Reads kReads>
    void extendedPlateFrames(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                             int stride, int accumulate);
    template <Reads kReads>
    void echoFrames(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                    int stride, int accumulate);
    void dryFrames(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames, int stride,
                   int accumulate);
    void convolutionFrames(float* outLeft, float* outRight, const float* inLeft, const float* inRight, int frames,
                           int stride, int accumulate);

    // Running peak of the wet or output meter within the current block.
    float meterPeak_ = 0.0f;
    // A mixed sample of the current block was not finite: the networks are silenced after the block.
    bool poisoned_ = false;
};

}  // namespace ulvetta
