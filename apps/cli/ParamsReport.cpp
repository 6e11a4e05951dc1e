#include "ParamsReport.h"

#include <cstdarg>
#include <cstdio>

#include "CliSetup.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

namespace {

struct Row {
    int id;
    std::string name;
    ParamDesc desc{};
    int32_t value = 0;
    double position = 0.0;
    std::string text, fullText, minText, maxText;
};

Row rowOf(ReverbCore& core, int id) {
    Row r;
    r.id = id;
    r.name = parameterName(core, id);
    r.desc = *findParam(id);
    r.value = core.getValue(id);
    r.position = positionOf(r.desc, r.value);
    char text[kValueTextCapacity];
    r.text = formatValue(r.desc, r.value, false, text, sizeof text);
    r.fullText = formatValue(r.desc, r.value, true, text, sizeof text);
    r.minText = formatValue(r.desc, r.desc.minimum, true, text, sizeof text);
    r.maxText = formatValue(r.desc, r.desc.maximum, true, text, sizeof text);
    return r;
}

std::string jsonString(const std::string& s) {
    std::string out = "\"";
    for (char c : s) {
        const unsigned char u = static_cast<unsigned char>(c);
        if (c == '"' || c == '\\') {
            out += '\\';
            out += c;
        } else if (u < 0x20) {
            char esc[8];
            std::snprintf(esc, sizeof esc, "\\u%04x", u);
            out += esc;
        } else {
            out += c;
        }
    }
    return out + "\"";
}

std::string format(const char* fmt, ...) __attribute__((format(printf, 1, 2)));
std::string format(const char* fmt, ...) {
    char buffer[512];
    va_list args;
    va_start(args, fmt);
    std::vsnprintf(buffer, sizeof buffer, fmt, args);
    va_end(args);
    return buffer;
}

}  // namespace

std::string paramsTable(ReverbCore& core) {
    std::string out = format("%2s  %-17s  %6s  %-6s  %-9s  %7s  %-8s  %7s  %-8s  %7s  %8s\n", "id", "name", "value", "text",
                             "full text", "minimum", "min text", "maximum", "max text", "default", "position");
    for (int id = 0; id < kParamCount; ++id) {
        const Row r = rowOf(core, id);
        out += format("%2d  %-17s  %6d  %-6s  %-9s  %7d  %-8s  %7d  %-8s  %7d  %8.6f\n", r.id, r.name.c_str(),
                      r.value, r.text.c_str(), r.fullText.c_str(), r.desc.minimum, r.minText.c_str(),
                      r.desc.maximum, r.maxText.c_str(), r.desc.defaultValue, r.position);
    }
    return out;
}

std::string paramsJson(ReverbCore& core) {
    std::string out = "[\n";
    for (int id = 0; id < kParamCount; ++id) {
        const Row r = rowOf(core, id);
        out += format("  {\"id\": %d, \"name\": %s, \"value\": %d, \"text\": %s, \"fullText\": %s, \"minimum\": %d, "
                      "\"maximum\": %d, \"minText\": %s, \"maxText\": %s, \"default\": %d, \"position\": %.17g}%s\n",
                      r.id, jsonString(r.name).c_str(), r.value, jsonString(r.text).c_str(),
                      jsonString(r.fullText).c_str(), r.desc.minimum, r.desc.maximum, jsonString(r.minText).c_str(),
                      jsonString(r.maxText).c_str(), r.desc.defaultValue, r.position,
                      id + 1 < kParamCount ? "," : "");
    }
    return out + "]\n";
}

std::string presetValues(ReverbCore& core) {
    static const char* const meterSources[] = {"input", "output", "wet"};
    std::string out;
    for (int id = 0; id < kParamCount; ++id) {
        const Row r = rowOf(core, id);
        std::string text = r.fullText;
        if (id == kAlgorithm) text = kAlgorithmNames[r.value] + std::string(" (") + std::to_string(r.value) + ")";
        if (id == kMeterSource) text = meterSources[r.value];
        out += r.name + ": " + text + "\n";
    }
    return out;
}

}  // namespace ulvetta
