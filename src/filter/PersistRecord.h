// PersistRecord: reads the settings record in the framing hosts store it with (a 20-byte head of size
// field and format GUID, then the rest of what the size field claims) from any byte stream, without
// holding more than one record's worth of memory. Portable; the DirectShow filter reads its IStream
// through it and then hands the bytes to ReverbCore::loadState, which validates them.
//
// Threads: one reader per object; it touches only its own buffer and the source. Never allocates.
#pragma once

#include <cstdint>

namespace ulvetta {

// A stream to read from.
class RecordSource {
public:
    virtual ~RecordSource() = default;
    // Reads up to count bytes into data and sets *got to the number read (fewer at the stream's end);
    // false when the stream reports an error, which ends the reading.
    virtual bool read(uint8_t* data, uint32_t count, uint32_t* got) = 0;
};

class PersistRecord {
public:
    static constexpr uint32_t kHeadSize = 20;
    // The largest record kept; a longer claim is consumed and refused.
    static constexpr uint32_t kCapacity = 1024;

    enum class Result {
        Complete,     // the whole claimed record is in bytes(), size() long (not yet validated)
        StreamError,  // the source reported an error
        Refused,      // a size field of 20 or less, a claim beyond kCapacity, or a stream that ended early
    };

    // Reads the head, then the size field's claim less the head: into the buffer when it fits, otherwise
    // in bounded pieces that are dropped, until the claim is met or the stream ends. A size field of 20 or
    // less stops after the head.
    Result read(RecordSource& source);

    const uint8_t* bytes() const { return buffer_; }
    int32_t size() const { return static_cast<int32_t>(size_); }

private:
    uint8_t buffer_[kCapacity] = {};
    uint32_t size_ = 0;
};

}  // namespace ulvetta
