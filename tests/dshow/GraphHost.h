// Builds real DirectShow graphs around Ulvetta for the tests: File Source -> WAVE Parser -> Ulvetta ->
// SampleGrabber -> Null Renderer, with no reference clock, and collects what reaches the grabber.
#pragma once

#include <windows.h>
#include <dshow.h>

#include <string>
#include <vector>

namespace ulvetta {
namespace test {

struct GraphResult {
    HRESULT hr = E_FAIL;          // the first failure while building or running, else S_OK
    std::string step;             // where it failed
    WAVEFORMATEX format{};        // the grabber's connection format
    std::vector<float> samples;   // interleaved output, 16-bit scaled by 1/32768
    bool completed = false;       // EC_COMPLETE arrived
    LONGLONG duration = -1;       // the graph's duration, asked through the filters' seeking pass-through
    size_t firstPassSamples = 0;  // samples collected before a replay
};

// Path of the module under test; loaded and registered by the test executable.
std::wstring ModulePath();

// Runs a WAV file through the filter. state: an 88-byte settings record to load first (may be empty).
// replay: after the end of the stream, seek back to the start while running and play it once more.
GraphResult RunGraph(const std::wstring& wavPath, const std::vector<unsigned char>& state, bool replay = false);

}  // namespace test
}  // namespace ulvetta
