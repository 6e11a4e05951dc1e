// Types arbitrary text into a parameter, as the editor's value fields and the command line's --set do. The
// first byte picks the id (also ids that do not exist); the rest, up to a zero, is the text. An unknown id
// changes nothing; a known one ends within its range, and its shown text typed back in gives the same
// value again (unless it is a limit's word such as "Off"). Every text fits its buffer.
#include <array>
#include <cstring>

#include "FuzzBytes.h"
#include "FuzzCore.h"

using namespace ulvetta;
using namespace ulvetta::fuzz;

namespace {

// The text of id's value, checked to be terminated within the capacity.
std::string textOf(ReverbCore& core, int32_t id, bool full) {
    char buffer[ReverbCore::kTextCapacity + 8];
    std::memset(buffer, 'x', sizeof buffer);
    core.getValueText(id, buffer, full);
    FUZZ_CHECK(std::memchr(buffer, '\0', ReverbCore::kTextCapacity) != nullptr);
    return buffer;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    ReverbCore& core = lowRateCore();
    FuzzBytes input(data, size);
    const int32_t id = input.take<int8_t>();
    const std::string text = input.rest();  // stops at its first zero when passed on
    const auto before = valuesOf(core);
    const bool known = id >= 0 && id < kParamCount;
    FUZZ_CHECK(core.setValueText(id, text.c_str()) == known);
    if (!known) {
        FUZZ_CHECK(valuesOf(core) == before);
        FUZZ_CHECK(textOf(core, id, true).empty());
        return 0;
    }
    const ParamDesc& d = kParamTable[id];
    const int32_t value = core.getValue(id);
    FUZZ_CHECK(value >= d.minimum && value <= d.maximum);
    const std::string shown = textOf(core, id, true);
    const std::string brief = textOf(core, id, false);
    const bool word = (d.hasMinText && value == d.minimum) || (d.hasMaxText && value == d.maximum);
    FUZZ_CHECK(word || brief.size() <= static_cast<size_t>(d.displayWidth));
    if (word || id == kAlgorithm) return 0;  // typing an algorithm's number again would reload its memory row
    FUZZ_CHECK(core.setValueText(id, shown.c_str()) && core.getValue(id) == value);
    return 0;
}
