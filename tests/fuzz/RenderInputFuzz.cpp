// Opens arbitrary bytes as the renderer's input file and reads it all, block by block, as `ulvetta render`
// does; a refusal must be the renderer's own one-sentence error. Every read must stay within its block and
// 16-bit input must come out as whole steps of 1/32768 within full scale.
#include <unistd.h>

#include <cmath>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <vector>

#include "AudioInput.h"
#include "CliSetup.h"
#include "FuzzBytes.h"

using namespace ulvetta;
namespace fs = std::filesystem;

namespace {

// Frames read from one input at most: a few seconds at the highest rate, so that a header claiming hours of
// a compressed format cannot stall the run.
constexpr long long kMostFrames = 1 << 22;

// The file the input is written to, one per process on tmpfs when there is one; removed at exit.
struct ScratchFile {
    ScratchFile() {
        const fs::path base = fs::is_directory("/dev/shm") ? fs::path("/dev/shm") : fs::temp_directory_path();
        path = base / ("ulvetta-render-fuzz-" + std::to_string(getpid()));
    }
    ~ScratchFile() {
        std::error_code ec;
        fs::remove(path, ec);
    }
    fs::path path;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const ScratchFile scratch;
    const fs::path& path = scratch.path;
    std::ofstream(path, std::ios::binary | std::ios::trunc).write(reinterpret_cast<const char*>(data), size);
    // The block length varies with the input so that reads straddle the input's internal chunks.
    const int block = 1 + static_cast<int>(size % 5000);
    static std::vector<float> stereo;
    stereo.assign(2 * static_cast<size_t>(block) + 2, 7.0f);
    try {
        AudioInput input(path.string());
        FUZZ_CHECK(input.sampleRate() >= kMinSampleRate && input.sampleRate() <= kMaxSampleRate);
        for (long long total = 0; total < kMostFrames;) {
            const int got = input.read(stereo.data(), block);
            FUZZ_CHECK(got >= 0 && got <= block);
            FUZZ_CHECK(stereo[2 * block] == 7.0f && stereo[2 * block + 1] == 7.0f);
            if (got == 0) break;
            for (int i = 0; i < 2 * got; ++i) {
                const float x = stereo[i];
                if (input.isPcm16()) FUZZ_CHECK(x * 32768.0f == std::trunc(x * 32768.0f) && std::fabs(x) <= 1.0f);
            }
            total += got;
        }
    } catch (const CliError& e) {
        const std::string m = e.what();
        FUZZ_CHECK(!m.empty() && m.find('\n') == std::string::npos);
    }
    return 0;
}
