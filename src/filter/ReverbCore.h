// ReverbCore: the host-independent effect. It owns the parameter table, the per-algorithm memory and the
// engine, applies parameters under its re-entrant lock, switches algorithms with their remembered
// settings, processes audio blocks and saves and loads the 88-byte settings record. The DirectShow
// filter, the editor and the command-line tool all drive it through these operations.
//
// Threads: every operation that touches parameters, state or the engine takes the core's lock for its
// whole duration; the lock is re-entrant because operations call one another under it. Listener and
// host callbacks run with the lock held, so a listener must not wait for a thread that needs it.
// Allocation: applying "Algorithm", "Room Size" and (in some algorithms) other parameters rebuilds the
// engine's network and allocates; processStereo allocates only to grow its scratch to a larger block.
#pragma once

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
    virtual bool setNormalized(int32_t id, float position);
    virtual float getNormalized(int32_t id);
    // Clamps, stores and applies; id 15 switches algorithm: the current sound values are saved into the
    // old algorithm's memory row and the new algorithm's row is loaded.
    virtual bool setValue(int32_t id, int32_t value);
    virtual int32_t getValue(int32_t id);
    virtual void notifyListeners(int32_t id);
    // Writes the value's text into buffer (at least kTextCapacity bytes) and returns buffer.
    virtual char* getValueText(int32_t id, char* buffer, bool full);
    virtual bool setValueText(int32_t id, SkinString text);
    virtual void notifyHost(int32_t id, float position);
    // 2: the algorithm's processing-load figure; 200: 1 when stopped; otherwise the meter level 0..1.
    virtual float getStatus(int32_t code);
    virtual void reserved9(int32_t) {}
    virtual void reserved10(int32_t, int32_t) {}
    virtual int32_t reserved11() { return 0; }
    virtual void reserved12(int32_t) {}
    virtual void idle() override {}
    virtual void setHost(CoreHost* h);
    virtual CoreHost* getHost();
    virtual void addListener(CoreListener* l);
    virtual void removeListener(CoreListener* l);
    virtual bool setValueAndNotify(int32_t id, int32_t value);
    // Stores the stream format; takes effect at the next apply.
    virtual void setFormat(float sampleRate, int32_t reserved, int32_t inChannels, int32_t outChannels);

    // Processing (streaming thread). processStereo returns the number of output frames that carry
    // signal: frames for an ordinary block, fewer while the end-of-stream tail is being trimmed.
    virtual int32_t processStereo(const float* inLeft, const float* inRight, float* outLeft, float* outRight,
                                  int32_t frames, int32_t stride, int32_t restart, int32_t flush,
                                  int32_t accumulate);
    virtual int32_t trackLevel(const float* samples, const void* unused, int32_t count, int32_t stride,
                               int32_t unused2, int32_t unused3);
    virtual int32_t copyMono(const float* source, float* destination, int32_t count, int32_t restart,
                             int32_t flush, int32_t add);
    virtual int32_t reservedProcess(int32_t a, int32_t b, int32_t c, int32_t d);

    virtual bool applyAll();
    virtual void resetLevel();
    virtual bool startStreaming();
    virtual void stopStreaming();
    // After a flush (a seek): the stream goes on, so an earlier end of stream no longer trims its blocks.
    // The reverb's sound state carries over.
    void resumeAfterFlush();

    // The settings record.
    virtual int32_t stateSize();
    virtual bool saveState(uint8_t* buffer);
    virtual bool loadState(const uint8_t* buffer, int32_t size);
    virtual bool validateState(const uint8_t* buffer, int32_t size);
    virtual double reserved32(const ParamDesc&) { return 0.0; }

    // Host integration that is not part of the core's slot list.
    void setCaptureTarget(CaptureTarget* t);
    void setBusyIndicator(BusyIndicator* b);
    // A copy of a parameter's record, taken under the lock; false for an unknown id.
    bool getParamDesc(int32_t id, ParamDesc& out);
    int32_t memoryValue(int32_t algorithm, int column);

    static constexpr int kTextCapacity = 32;

    // Copies the convolution response prepared for the applied settings (one sample per frame at the stream
    // rate, per channel); false when the algorithm is not a convolution or nothing is prepared yet.
    // Any thread; takes the core's lock (a block waits for the copy); allocates the two vectors.
    bool preparedResponse(std::vector<float>& left, std::vector<float>& right);

    // The engine for tests (through EngineProbe) and diagnostics; use it only while nothing else uses the
    // core.
    const ReverbEngine& engineForInspection() const { return engine_; }

private:
    void parameterChanged(int32_t id, float position) override;
    bool applyParam(ParamDesc& p);
    void switchAlgorithm(int32_t newValue);

    uint8_t meterBlock_[32] = {};
    Mutex lock_;
    std::vector<ParamDesc*> params_;
    std::vector<CoreListener*> listeners_;
    CoreHost* host_ = nullptr;
    float sampleRate_ = 44100.0f;
    int32_t reservedFormat_ = 0;
    int32_t inChannels_ = 2;
    int32_t outChannels_ = 2;
    ParamTable table_;
    bool applied_ = false;
    ReverbEngine engine_;
    ProgramMemory memory_;
    bool stopped_ = false;
    int32_t mediaParamIds_[kSoundParamCount];
    CaptureTarget* captureTarget_ = nullptr;
    BusyIndicator* busy_ = nullptr;
};

}  // namespace ulvetta
