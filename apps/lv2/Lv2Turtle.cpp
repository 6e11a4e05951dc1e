#include "Lv2Turtle.h"

#include <cctype>
#include <cmath>
#include <cstdio>
#include <sstream>

#include "Lv2Ports.h"
#include "filter/ReverbCore.h"
#include "presets/FactoryPresets.h"

namespace ulvetta::lv2 {
namespace {

constexpr const char* kPrefixes =
    "@prefix atom: <http://lv2plug.in/ns/ext/atom#> .\n"
    "@prefix doap: <http://usefulinc.com/ns/doap#> .\n"
    "@prefix lv2: <http://lv2plug.in/ns/lv2core#> .\n"
    "@prefix pprops: <http://lv2plug.in/ns/ext/port-props#> .\n"
    "@prefix pset: <http://lv2plug.in/ns/ext/presets#> .\n"
    "@prefix rdf: <http://www.w3.org/1999/02/22-rdf-syntax-ns#> .\n"
    "@prefix rdfs: <http://www.w3.org/2000/01/rdf-schema#> .\n"
    "@prefix state: <http://lv2plug.in/ns/ext/state#> .\n"
    "@prefix ui: <http://lv2plug.in/ns/extensions/ui#> .\n"
    "@prefix units: <http://lv2plug.in/ns/extensions/units#> .\n"
    "@prefix urid: <http://lv2plug.in/ns/ext/urid#> .\n\n";

// The unit a parameter's shown value is in; null when it has none.
const char* unitOf(int32_t id) {
  switch (id) {
    case kPreDelay: return "units:ms";
    case kEarlyReflections:
    case kOutputLevelWet:
    case kOutputLevelDry:
    case kInputGain:
    case kNotchGain: return "units:db";
    case kLowPassFreq:
    case kHighPassFreq:
    case kNotchFreq: return "units:hz";
    default: return nullptr;
  }
}

std::string presetSlugUri(int index) { return std::string(kPluginUri) + ":preset:" + factoryPresetSlug(index); }

std::string scalePoint(const std::string& label, double value) {
  return "[ rdfs:label " + turtleString(label) + " ; rdf:value " + turtleNumber(value) + " ]";
}

void writeControlPort(std::ostringstream& out, int32_t id) {
  const ParamDesc& d = kParamTable[id];
  out << "    a lv2:InputPort , lv2:ControlPort ;\n"
      << "    lv2:index " << paramPort(id) << " ;\n"
      << "    lv2:symbol " << turtleString(kParamSymbols[id]) << " ;\n"
      << "    lv2:name " << turtleString(paramPortName(id)) << " ;\n"
      << "    lv2:default " << turtleNumber(portValueOf(id, d.defaultValue)) << " ;\n"
      << "    lv2:minimum " << turtleNumber(portValueOf(id, d.minimum)) << " ;\n"
      << "    lv2:maximum " << turtleNumber(portValueOf(id, d.maximum)) << " ;\n";
  std::vector<std::string> points;
  if (id == kAlgorithm) {
    out << "    lv2:portProperty lv2:integer , lv2:enumeration ;\n";
    for (int a = 0; a < kAlgorithmCount; ++a) points.push_back(scalePoint(kAlgorithmNames[a], a));
  } else if (id == kMeterSource) {
    out << "    lv2:portProperty lv2:integer , lv2:enumeration ;\n";
    const char* names[] = {"In", "Out", "Verb"};
    for (int s = 0; s < 3; ++s) points.push_back(scalePoint(names[s], s));
  } else {
    if (d.decimals == 0) out << "    lv2:portProperty lv2:integer ;\n";
    if (d.curve == Curve::LogTaper && d.minimum > 0) out << "    lv2:portProperty pprops:logarithmic ;\n";
    if (d.hasMinText) points.push_back(scalePoint(d.minText, portValueOf(id, d.minimum)));
    if (d.hasMaxText) points.push_back(scalePoint(d.maxText, portValueOf(id, d.maximum)));
  }
  if (const char* unit = unitOf(id)) out << "    units:unit " << unit << " ;\n";
  for (size_t i = 0; i < points.size(); ++i)
    out << (i == 0 ? "    lv2:scalePoint " : "        ") << points[i] << (i + 1 < points.size() ? " ,\n" : " ;\n");
}

void writeSimplePort(std::ostringstream& out, const char* kinds, uint32_t index, const char* symbol,
                     const char* name, const char* extra) {
  out << "    a " << kinds << " ;\n    lv2:index " << index << " ;\n    lv2:symbol " << turtleString(symbol)
      << " ;\n    lv2:name " << turtleString(name) << " ;\n" << extra;
}

}  // namespace

std::vector<PresetValues> factoryPresets() {
  std::vector<PresetValues> presets;
  for (int a = 0; a < kAlgorithmCount; ++a) {
    ReverbCore core;
    core.setValue(kAlgorithm, a);
    PresetValues p{kAlgorithmNames[a], {}};
    for (int32_t id = 0; id < kParamCount; ++id) p.steps[id] = core.getValue(id);
    presets.push_back(p);
  }
  return presets;
}

bool presetFromRecord(const std::string& name, const uint8_t* record, size_t size, PresetValues* out) {
  ReverbCore core;
  if (size != static_cast<size_t>(core.stateSize()) || !core.validateState(record, static_cast<int32_t>(size)) ||
      !core.loadState(record, static_cast<int32_t>(size)))
    return false;
  out->name = name;
  for (int32_t id = 0; id < kParamCount; ++id) out->steps[id] = core.getValue(id);
  return true;
}

std::string turtleNumber(double value) {
  char text[64];
  std::snprintf(text, sizeof text, "%.6f", value);
  std::string s = text;
  while (s.size() > 1 && s.back() == '0' && s[s.size() - 2] != '.') s.pop_back();
  if (s == "-0.0") s = "0.0";
  return s;
}

std::string turtleString(const std::string& text) {
  std::string out = "\"";
  for (char c : text) {
    const unsigned char u = static_cast<unsigned char>(c);
    if (c == '"' || c == '\\') {
      out += '\\';
      out += c;
    } else if (c == '\n') {
      out += "\\n";
    } else if (c == '\r') {
      out += "\\r";
    } else if (c == '\t') {
      out += "\\t";
    } else if (u < 0x20 || u == 0x7f) {
      char esc[8];
      std::snprintf(esc, sizeof esc, "\\u%04X", u);
      out += esc;
    } else {
      out += c;
    }
  }
  return out + "\"";
}

std::string manifestTtl(const std::string& binary, const std::string& uiBinary) {
  std::ostringstream out;
  out << kPrefixes << "<" << kPluginUri << ">\n    a lv2:Plugin ;\n    lv2:binary <" << binary
      << "> ;\n    rdfs:seeAlso <ulvetta.ttl> .\n";
  if (!uiBinary.empty())
    out << "\n<" << kUiUri << ">\n    a ui:X11UI ;\n    ui:binary <" << uiBinary << "> ;\n    rdfs:seeAlso <ulvetta.ttl> .\n";
  for (int a = 0; a < kAlgorithmCount; ++a)
    out << "\n<" << presetSlugUri(a) << ">\n    a pset:Preset ;\n    lv2:appliesTo <" << kPluginUri
        << "> ;\n    rdfs:seeAlso <presets.ttl> .\n";
  return out.str();
}

std::string pluginTtl() {
  std::ostringstream out;
  out << kPrefixes << "<" << kPluginUri << ">\n"
      << "    a lv2:Plugin , lv2:ReverbPlugin ;\n"
      << "    doap:name \"Ulvetta\" ;\n"
      << "    doap:license <http://usefulinc.com/doap/licenses/unspecified> ;\n"
      << "    lv2:project [ doap:name \"Ulvetta\" ] ;\n"
      << "    lv2:optionalFeature lv2:hardRTCapable ;\n"
      << "    lv2:requiredFeature urid:map ;\n"
      << "    lv2:extensionData state:interface ;\n"
      << "    ui:ui <" << kUiUri << "> ;\n"
      << "    lv2:port [\n";
  writeSimplePort(out, "lv2:InputPort , lv2:AudioPort", kInLeft, "in_left", "In Left", "");
  out << "    ] , [\n";
  writeSimplePort(out, "lv2:InputPort , lv2:AudioPort", kInRight, "in_right", "In Right", "");
  out << "    ] , [\n";
  writeSimplePort(out, "lv2:OutputPort , lv2:AudioPort", kOutLeft, "out_left", "Out Left", "");
  out << "    ] , [\n";
  writeSimplePort(out, "lv2:OutputPort , lv2:AudioPort", kOutRight, "out_right", "Out Right", "");
  for (int32_t id = 0; id < kParamCount; ++id) {
    out << "    ] , [\n";
    writeControlPort(out, id);
  }
  out << "    ] , [\n";
  writeSimplePort(out, "lv2:OutputPort , lv2:ControlPort", kMeter, "meter", "Meter",
                  "    lv2:minimum 0.0 ;\n    lv2:maximum 1.0 ;\n");
  out << "    ] , [\n";
  writeSimplePort(out, "lv2:OutputPort , lv2:ControlPort", kLoad, "load", "Processing Load",
                  "    lv2:minimum 0.0 ;\n    lv2:maximum 1.0 ;\n");
  out << "    ] , [\n";
  writeSimplePort(out, "lv2:OutputPort , lv2:ControlPort", kLatency, "latency", "Latency",
                  "    lv2:portProperty lv2:reportsLatency , lv2:integer ;\n    units:unit units:frame ;\n");
  out << "    ] .\n\n";
  // The editor: a fixed-size X11 window, ticked by the host's idle calls, fed the meter by port events.
  out << "<" << kUiUri << ">\n"
      << "    a ui:X11UI ;\n"
      << "    lv2:optionalFeature ui:parent , ui:resize , ui:noUserResize ;\n"
      << "    lv2:requiredFeature ui:idleInterface ;\n"
      << "    lv2:extensionData ui:idleInterface ;\n"
      << "    ui:portNotification [\n"
      << "        ui:plugin <" << kPluginUri << "> ;\n"
      << "        lv2:symbol \"meter\" ;\n"
      << "        ui:protocol ui:floatProtocol\n"
      << "    ] .\n";
  return out.str();
}

std::string presetTtl(const PresetValues& preset, const std::string& uri) {
  std::ostringstream out;
  out << "<" << uri << ">\n    a pset:Preset ;\n    lv2:appliesTo <" << kPluginUri << "> ;\n    rdfs:label "
      << turtleString(preset.name) << " ;\n    lv2:port [\n";
  for (int32_t id = 0; id < kParamCount; ++id) {
    out << "        lv2:symbol " << turtleString(kParamSymbols[id]) << " ;\n        pset:value "
        << turtleNumber(portValueOf(id, preset.steps[id])) << "\n    ]" << (id + 1 < kParamCount ? " , [\n" : " .\n");
  }
  return out.str();
}

std::string factoryPresetsTtl() {
  std::ostringstream out;
  out << kPrefixes;
  const std::vector<PresetValues> presets = factoryPresets();
  for (size_t a = 0; a < presets.size(); ++a)
    out << (a ? "\n" : "") << presetTtl(presets[a], presetSlugUri(static_cast<int>(a)));
  return out.str();
}

std::string userPresetUri(const std::string& name) {
  // Percent-encodes everything but unreserved characters, so any preset name makes a valid URI.
  std::string uri = std::string(kPluginUri) + ":user-preset:";
  for (char c : name) {
    const unsigned char u = static_cast<unsigned char>(c);
    if (std::isalnum(u) || c == '-' || c == '_' || c == '.' || c == '~') {
      uri += c;
    } else {
      char esc[4];
      std::snprintf(esc, sizeof esc, "%%%02X", u);
      uri += esc;
    }
  }
  return uri;
}

std::string userPresetTtl(const PresetValues& preset) {
  return std::string(kPrefixes) + presetTtl(preset, userPresetUri(preset.name));
}

std::string userPresetFileName(size_t index) { return "preset-" + std::to_string(index + 1) + ".ttl"; }

std::string userManifestTtl(const std::vector<PresetValues>& presets) {
  std::ostringstream out;
  out << kPrefixes;
  for (size_t i = 0; i < presets.size(); ++i)
    out << (i ? "\n" : "") << "<" << userPresetUri(presets[i].name) << ">\n    a pset:Preset ;\n    lv2:appliesTo <"
        << kPluginUri << "> ;\n    rdfs:seeAlso <" << userPresetFileName(i) << "> .\n";
  return out.str();
}

}  // namespace ulvetta::lv2
