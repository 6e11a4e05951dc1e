// ReverbCore: the host-independent effect. It holds the live parameter values beside the constant
// parameter table, the per-algorithm memory and the engine; applies parameters under its re-entrant lock,
// switches algorithms with their remembered settings, processes audio blocks and saves and loads the
// 88-byte settings record. The DirectShow filter, the editor and the command-line tool all drive it
// through these operations.
//
// Threads: each operation's tag says who may call it, which lock it takes and whether it may allocate.
// The lock is re-entrant because operations call one another under it. Threads take it in turns: the
// streaming thread and a thread changing parameters as fast as it can alternate, so neither waits for more
// than the other's operation in progress and the next one queued. A parameter change holds the lock briefly: while streaming, a convolution response is prepared on the engine's preparation thread
// and switched in by a later block; otherwise it is prepared once, when the outermost operation ends. Listener refreshes and a
// CoreHost other than the core itself run with the lock held, so they must not wait for a thread that
// needs it. Capture reports are made after the outermost lock is released, in the order of the changes.
// "May allocate": applying a parameter that rebuilds the engine's networks (Algorithm, Room Size, Pre
// Delay and, in some algorithms, Diffusion, Decay and Damping) allocates; processStereo allocates only
// to grow its scratch to a larger block than any before.
#pragma once

#include <atomic>
#include <cstdint>
#include <vector>

#include "engine/ReverbEngine.h"
#include "filter/ParamTable.h"
#include "platform/Mutex.h"

namespace ulvetta {

// Receives parameter-change notices (the editor's sliders reach the engine through it).
class CoreHost {
public:
    virtual ~CoreHost() = default;
    virtual void parameterChanged(int32_t id, float position) = 0;
    virtual void idle() = 0;
};

// An editor page that redraws when parameters change elsewhere.
class CoreListener {
public:
    virtual ~CoreListener() = default;
    // id + 1001 for one parameter, kRefreshAll after a whole state was loaded.
    virtual void refresh(int32_t code) = 0;
};

constexpr int32_t kRefreshAll = 10000;
constexpr int32_t kRefreshParamBase = 1001;

// Where the core reports a parameter the user changed, for a host that records automation.
class CaptureTarget {
public:
    virtual ~CaptureTarget() = default;
    virtual void captureParameter(int32_t id, float position) = 0;
};

// Shows the host's busy indication (the wait cursor) around an algorithm switch; optional.
class BusyIndicator {
public:
    virtual ~BusyIndicator() = default;
    virtual void begin() = 0;
    virtual void end() = 0;
};

// Status codes of getStatus.
constexpr int32_t kStatusLoad = 2;
constexpr int32_t kStatusStopped = 200;
constexpr int32_t kStatusLevel = 0;

class ReverbCore : public LevelOwner, private CoreHost {
public:
    ReverbCore();
    virtual ~ReverbCore();
    ReverbCore(const ReverbCore&) = delete;
    ReverbCore& operator=(const ReverbCore&) = delete;

    // Parameters. An unknown id is rejected (false / 0) without touching anything.
    // [any thread] locks core; may allocate. Maps the position (no memory rows, even for Algorithm).
    virtual bool setNormalized(int32_t id, float position);
    // [any thread] locks core; never allocates.
    virtual float getNormalized(int32_t id);
    // [any thread] locks core; may allocate. Clamps, stores and applies; id 15 switches algorithm: the
    // current sound values are saved into the old algorithm's memory row and the new row is loaded.
    virtual bool setValue(int32_t id, int32_t value);
    // [any thread] locks core; never allocates.
    virtual int32_t getValue(int32_t id);
    // [any thread] locks core; never allocates (listeners run under the lock).
    virtual void notifyListeners(int32_t id);
    // [any thread] locks core; never allocates. Writes the value's text into buffer (at least
    // kTextCapacity bytes) and returns buffer; an empty text for an unknown id.
    virtual char* getValueText(int32_t id, char* buffer, bool full);
    // [any thread] locks core; may allocate. Parses text in the parameter's shown units, then
    // setValueAndNotify.
    virtual bool setValueText(int32_t id, const char* text);
    // [any thread] locks core; may allocate. Hands the change to the host (by default the core itself,
    // which applies the position and queues a capture report).
    virtual void notifyHost(int32_t id, float position);
    // [any thread] locks core; never allocates. 2: the algorithm's processing-load figure; 200: 1 when
    // stopped; otherwise the meter level 0..1.
    virtual float getStatus(int32_t code);
    // Placeholders that keep the later operations in their slots: they do nothing, or return a constant
    // or an argument. [any thread] no lock; never allocate.
    virtual void ignoreOne(int32_t) {}
    virtual void ignoreTwo(int32_t, int32_t) {}
    virtual int32_t zero() { return 0; }
    virtual void ignoreOneMore(int32_t) {}
    // [any thread] no lock; never allocates. Does nothing.
    virtual void idle() override {}
    // [set-up and tear-down only] no lock; never allocate.
    virtual void setHost(CoreHost* h);
    virtual CoreHost* getHost();
    // [any thread] locks core; may allocate.
    virtual void addListener(CoreListener* l);
    // [any thread] locks core; never allocates. Removes every entry equal to l.
    virtual void removeListener(CoreListener* l);
    // [any thread] locks core; may allocate. setValue, then notifyHost with the value's position.
    virtual bool setValueAndNotify(int32_t id, int32_t value);
    // [any thread] locks core; never allocates. Stores the sample rate for the next apply when it rounds
    // to 1..768000 Hz (any other is ignored); the other arguments are accepted for the callers' sake and
    // not used.
    virtual void setFormat(float sampleRate, int32_t reserved, int32_t inChannels, int32_t outChannels);

    // Processing. processStereo returns the number of output frames that carry signal: frames for an
    // ordinary block, fewer while the end-of-stream tail is being trimmed.
    // [streaming thread] locks core; allocates only to grow the mono scratch to a larger block.
    virtual int32_t processStereo(const float* inLeft, const float* inRight, float* outLeft, float* outRight,
                                  int32_t frames, int32_t stride, int32_t restart, int32_t flush,
                                  int32_t accumulate);
    // [streaming thread] locks core; never allocates.
    virtual int32_t trackLevel(const float* samples, const void* unused, int32_t count, int32_t stride,
                               int32_t unused2, int32_t unused3);
    // [streaming thread] locks core; never allocates.
    virtual int32_t copyMono(const float* source, float* destination, int32_t count, int32_t restart,
                             int32_t flush, int32_t add);
    // Placeholder in the processing slots: returns its second argument. [any thread] no lock; never
    // allocates.
    virtual int32_t passSecond(int32_t a, int32_t b, int32_t c, int32_t d);

    // [graph thread] locks core; may allocate. Applies every parameter in id order.
    virtual bool applyAll();
    // [any thread] locks core; never allocates.
    virtual void resetLevel();
    // [graph thread] locks core; may allocate (the first apply and the engine's reset). Returns once the
    // convolution response for the settings is prepared; from then until stopStreaming responses are
    // prepared off the calling threads.
    virtual bool startStreaming();
    // [graph thread] locks core; never allocates.
    virtual void stopStreaming();
    // [graph thread] locks core; never allocates. After a flush (a seek): the stream goes on, so an
    // earlier end of stream no longer trims its blocks. The reverb's sound state carries over.
    void resumeAfterFlush();

    // The settings record.
    // [any thread] no lock; never allocates.
    virtual int32_t stateSize();
    // [any thread] locks core; never allocates.
    virtual bool saveState(uint8_t* buffer);
    // [any thread] locks core; may allocate (the algorithm switch).
    virtual bool loadState(const uint8_t* buffer, int32_t size);
    // [any thread] no lock (reads only its arguments); never allocates.
    virtual bool validateState(const uint8_t* buffer, int32_t size);
    // Placeholder: returns 0.0. [any thread] no lock; never allocates.
    virtual double zeroForParam(const ParamDesc&) { return 0.0; }

    // Host integration that is not part of the core's slot list.
    // [any thread] locks core; never allocates. The target receives each change that goes through
    // notifyHost, on the changing thread, after the core's lock is released.
    void setCaptureTarget(CaptureTarget* t);
    // [any thread] locks core; never allocates.
    void setBusyIndicator(BusyIndicator* b);
    // [any thread] locks core; never allocates. A value of an algorithm's memory row (column = table
    // position); 0 outside the rows.
    int32_t memoryValue(int32_t algorithm, int column);

    static constexpr int kTextCapacity = static_cast<int>(kValueTextCapacity);

    // Copies the convolution response prepared for the applied settings (one sample per frame at the stream
    // rate, per channel); false when the algorithm is not a convolution or nothing is prepared yet.
    // Any thread; takes the core's lock (a block waits for the copy); allocates the two vectors.
    bool preparedResponse(std::vector<float>& left, std::vector<float>& right);

    // [any thread but the streaming one] no lock; never allocates. Waits until no convolution response is
    // being prepared off the calling threads; the next block plays what was prepared. For offline hosts
    // that change settings while rendering, and for tests.
    void waitForPreparation() { engine_.WaitForPreparation(); }

    // The engine for tests (through EngineProbe) and diagnostics; use it only while nothing else uses the
    // core.
    const ReverbEngine& engineForInspection() const { return engine_; }

private:
    // One capture report waiting for the outermost lock to be released.
    struct CaptureReport {
        CaptureTarget* target;
        int32_t id;
        float position;
    };
    // Holds the core's lock, taken in turns (see the header); the outermost guard brackets the engine's
    // changes and delivers the queued capture reports after unlocking.
    class Guard {
    public:
        explicit Guard(ReverbCore& core);
        ~Guard();
        Guard(const Guard&) = delete;
        Guard& operator=(const Guard&) = delete;

    private:
        ReverbCore& core_;
    };

    void parameterChanged(int32_t id, float position) override;
    bool applyParam(int32_t id);
    void switchAlgorithm(int32_t newValue);
    void deliverCaptureReports();

    Mutex lock_;
    Mutex turnstile_;                          // held by the one thread waiting for lock_
    std::atomic<const void*> owner_{nullptr};  // a mark of the thread holding lock_, or null
    int lockDepth_ = 0;  // guards held by the locking thread
    std::vector<CaptureReport> pendingReports_;
    std::vector<CoreListener*> listeners_;
    CoreHost* host_ = nullptr;
    float sampleRate_ = 44100.0f;
    int32_t values_[kParamCount];  // live values in steps, indexed by id
    bool applied_ = false;
    ReverbEngine engine_;
    ProgramMemory memory_;
    bool stopped_ = false;
    CaptureTarget* captureTarget_ = nullptr;
    BusyIndicator* busy_ = nullptr;
};

}  // namespace ulvetta
