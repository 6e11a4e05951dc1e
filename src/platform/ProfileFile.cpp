#include "platform/ProfileFile.h"

#include <cstdint>
#include <vector>

namespace ulvetta {

namespace {

constexpr std::string_view kUtf8Mark = "\xEF\xBB\xBF";

bool isBlank(char c) { return c == ' ' || c == '\t'; }

std::string_view trim(std::string_view s) {
    while (!s.empty() && isBlank(s.front())) s.remove_prefix(1);
    while (!s.empty() && isBlank(s.back())) s.remove_suffix(1);
    return s;
}

char lower(char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c; }

// Names match without regard to (ASCII) letter case.
bool sameName(std::string_view a, std::string_view b) {
    if (a.size() != b.size()) return false;
    for (size_t i = 0; i < a.size(); ++i)
        if (lower(a[i]) != lower(b[i])) return false;
    return true;
}

// One line of the file as the profile calls see it.
struct Line {
    enum Kind { kOther, kSection, kEntry } kind = kOther;
    std::string_view text;   // without its line break
    std::string_view name;   // section or key name, trimmed
    std::string_view value;  // entry value, trimmed
};

Line classify(std::string_view text) {
    Line line;
    line.text = text;
    const std::string_view t = trim(text);
    if (t.empty() || t.front() == ';') return line;
    if (t.front() == '[') {
        const size_t close = t.find(']');
        if (close == std::string_view::npos) return line;
        line.kind = Line::kSection;
        line.name = trim(t.substr(1, close - 1));
        return line;
    }
    // A line without "=" is a key without a value.
    const size_t eq = t.find('=');
    line.name = trim(t.substr(0, eq));
    if (line.name.empty()) return line;
    line.kind = Line::kEntry;
    if (eq != std::string_view::npos) line.value = trim(t.substr(eq + 1));
    return line;
}

// Splits text into lines (LF or CRLF); a UTF-8 byte-order mark at the start is moved into mark.
std::vector<Line> splitLines(std::string_view text, std::string_view* mark) {
    *mark = {};
    if (text.substr(0, kUtf8Mark.size()) == kUtf8Mark) {
        *mark = text.substr(0, kUtf8Mark.size());
        text.remove_prefix(kUtf8Mark.size());
    }
    std::vector<Line> lines;
    while (!text.empty()) {
        const size_t end = text.find('\n');
        std::string_view line = text.substr(0, end);
        if (!line.empty() && line.back() == '\r') line.remove_suffix(1);
        lines.push_back(classify(line));
        if (end == std::string_view::npos) break;
        text.remove_prefix(end + 1);
    }
    return lines;
}

// Where a key lives: the first section of that name, its key line, and the line after its last entry.
struct Place {
    size_t section = SIZE_MAX;
    size_t entry = SIZE_MAX;
    size_t insertAt = SIZE_MAX;
};

Place locate(const std::vector<Line>& lines, std::string_view section, std::string_view key) {
    Place p;
    for (size_t i = 0; i < lines.size(); ++i) {
        if (lines[i].kind != Line::kSection || !sameName(lines[i].name, section)) continue;
        p.section = i;
        p.insertAt = i + 1;
        for (size_t j = i + 1; j < lines.size() && lines[j].kind != Line::kSection; ++j) {
            if (lines[j].kind != Line::kEntry) continue;
            p.insertAt = j + 1;
            if (p.entry == SIZE_MAX && sameName(lines[j].name, key)) p.entry = j;
        }
        break;
    }
    return p;
}

}  // namespace

std::string ProfileFile::findValue(std::string_view text, std::string_view section, std::string_view key) {
    std::string_view mark;
    const std::vector<Line> lines = splitLines(text, &mark);
    const Place p = locate(lines, trim(section), trim(key));
    if (p.entry == SIZE_MAX) return {};
    std::string_view v = lines[p.entry].value;
    if (v.size() >= 2 && (v.front() == '"' || v.front() == '\'') && v.back() == v.front())
        v = v.substr(1, v.size() - 2);
    return std::string(v);
}

std::string ProfileFile::withValue(std::string_view text, std::string_view section, std::string_view key,
                                   std::string_view value) {
    std::string_view mark;
    const std::vector<Line> lines = splitLines(text, &mark);
    section = trim(section);
    key = trim(key);
    const Place p = locate(lines, section, key);
    std::string entry = std::string(key) + "=" + std::string(value);

    std::string out(mark);
    auto put = [&out](std::string_view line) {
        out += line;
        out += "\r\n";
    };
    for (size_t i = 0; i < lines.size(); ++i) {
        if (i == p.entry) {
            // The key keeps its spelling; only the value changes.
            put(std::string(lines[i].name) + "=" + std::string(value));
            continue;
        }
        put(lines[i].text);
        if (p.entry == SIZE_MAX && i + 1 == p.insertAt) put(entry);
    }
    if (p.section == SIZE_MAX) {
        // A blank line sets a new section apart from the one before it.
        if (!lines.empty() && !trim(lines.back().text).empty()) put("");
        put("[" + std::string(section) + "]");
        put(entry);
    }
    return out;
}

bool ProfileFile::writable(std::string_view section, std::string_view key, std::string_view value) {
    for (std::string_view s : {section, key, value})
        if (s.find_first_of(std::string_view("\r\n\0", 3)) != std::string_view::npos) return false;
    section = trim(section);
    key = trim(key);
    return !section.empty() && !key.empty() && section.find(']') == std::string_view::npos &&
           key.find('=') == std::string_view::npos && key.front() != ';' && key.front() != '[';
}

}  // namespace ulvetta
