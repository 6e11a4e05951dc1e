// Helpers shared by the fuzz targets: a reader that splits the fuzzer's bytes into fields (missing bytes
// read as zero, so every input is usable) and the check that turns a broken property into a crash the
// fuzzer saves.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

namespace ulvetta {
namespace fuzz {

class FuzzBytes {
public:
    FuzzBytes(const uint8_t* data, size_t size) : data_(data), size_(size) {}

    size_t remaining() const { return size_ - at_; }
    bool empty() const { return at_ == size_; }

    template <class T>
    T take() {
        uint8_t raw[sizeof(T)] = {};
        const size_t n = remaining() < sizeof(T) ? remaining() : sizeof(T);
        std::memcpy(raw, data_ + at_, n);
        at_ += n;
        T v;
        std::memcpy(&v, raw, sizeof(T));
        return v;
    }
    // Up to count bytes (fewer at the end), as a string that may hold zeros.
    std::string bytes(size_t count) {
        const size_t n = remaining() < count ? remaining() : count;
        std::string s(reinterpret_cast<const char*>(data_ + at_), n);
        at_ += n;
        return s;
    }
    // A field of at most limit bytes whose length comes first (one byte).
    std::string field(size_t limit) { return bytes(take<uint8_t>() % (limit + 1)); }
    std::string rest() { return bytes(remaining()); }

private:
    const uint8_t* data_;
    size_t size_;
    size_t at_ = 0;
};

// Aborts, naming the property, when it does not hold.
#define FUZZ_CHECK(holds)                                                           \
    do {                                                                            \
        if (!(holds)) {                                                             \
            std::fprintf(stderr, "%s:%d: property failed: %s\n", __FILE__, __LINE__, #holds); \
            std::abort();                                                           \
        }                                                                           \
    } while (0)

}  // namespace fuzz
}  // namespace ulvetta
