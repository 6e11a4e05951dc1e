// Reads the settings record from an arbitrary stream, as a host's saved project hands it over. The first
// byte shapes the stream (low nibble: most bytes a read returns, 0 for all asked; high nibble: the read that
// fails, 0 for none); the rest is its content. The reader must never ask for more than its buffer, never
// read past the size field's claim once it knows it, pass a stream error on, and hand over a record that
// the core accepts only when it is exactly the stream's first 88 bytes.
#include <algorithm>
#include <cstring>

#include "FuzzBytes.h"
#include "filter/PersistRecord.h"
#include "filter/ReverbCore.h"

using namespace ulvetta;

namespace {

class MemoryStream : public RecordSource {
public:
    MemoryStream(const std::string& content, uint32_t mostPerRead, int failingRead)
        : content_(content), mostPerRead_(mostPerRead), failingRead_(failingRead) {}

    bool read(uint8_t* data, uint32_t count, uint32_t* got) override {
        FUZZ_CHECK(count <= PersistRecord::kCapacity);
        if (++reads_ == failingRead_) return false;
        uint32_t n = static_cast<uint32_t>(std::min<size_t>(count, content_.size() - position_));
        if (mostPerRead_ != 0) n = std::min(n, mostPerRead_);
        std::copy_n(content_.data() + position_, n, data);
        position_ += n;
        *got = n;
        return true;
    }
    size_t position() const { return position_; }
    int reads() const { return reads_; }

private:
    const std::string& content_;
    uint32_t mostPerRead_;
    int failingRead_;
    int reads_ = 0;
    size_t position_ = 0;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static ReverbCore core;
    fuzz::FuzzBytes input(data, size);
    const uint8_t shape = input.take<uint8_t>();
    const std::string content = input.rest();
    MemoryStream stream(content, shape & 15u, shape >> 4);
    PersistRecord record;
    const PersistRecord::Result result = record.read(stream);

    FUZZ_CHECK((result == PersistRecord::Result::StreamError) == (stream.reads() == (shape >> 4)));
    uint8_t head[4] = {};
    std::copy_n(content.data(), std::min<size_t>(4, content.size()), head);
    const uint32_t claimed = head[0] | head[1] << 8 | head[2] << 16 | static_cast<uint32_t>(head[3]) << 24;
    // The head is read whole first, whatever it claims; after that the claim bounds the reading.
    FUZZ_CHECK(stream.position() <= std::max<size_t>(PersistRecord::kHeadSize, claimed));
    if (result != PersistRecord::Result::Complete) return 0;
    FUZZ_CHECK(record.size() > 20 && static_cast<uint32_t>(record.size()) <= PersistRecord::kCapacity);
    if (core.validateState(record.bytes(), record.size()))
        FUZZ_CHECK(content.size() >= 88 && std::memcmp(record.bytes(), content.data(), 88) == 0);
    return 0;
}
