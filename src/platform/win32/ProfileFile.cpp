#include "platform/ProfileFile.h"

#include <windows.h>

namespace ulvetta {

namespace {

std::wstring wide(const std::string& utf8) {
    if (utf8.empty()) return {};
    const int n = MultiByteToWideChar(CP_UTF8, 0, utf8.data(), static_cast<int>(utf8.size()), nullptr, 0);
    std::wstring out(static_cast<size_t>(n), L'\0');
    MultiByteToWideChar(CP_UTF8, 0, utf8.data(), static_cast<int>(utf8.size()), &out[0], n);
    return out;
}

std::string utf8(const wchar_t* text, int length) {
    if (length <= 0) return {};
    const int n = WideCharToMultiByte(CP_UTF8, 0, text, length, nullptr, 0, nullptr, nullptr);
    std::string out(static_cast<size_t>(n), '\0');
    WideCharToMultiByte(CP_UTF8, 0, text, length, &out[0], n, nullptr, nullptr);
    return out;
}

// Names go to the system trimmed, as the portable writer writes them.
std::wstring name(const std::string& text) {
    const size_t first = text.find_first_not_of(" \t");
    if (first == std::string::npos) return {};
    return wide(text.substr(first, text.find_last_not_of(" \t") + 1 - first));
}

}  // namespace

std::string ProfileFile::read(const std::string& section, const std::string& key) const {
    if (path_.empty()) return {};
    wchar_t buffer[kMaxValue + 1];
    const DWORD n = GetPrivateProfileStringW(name(section).c_str(), name(key).c_str(), L"", buffer,
                                             kMaxValue + 1, wide(path_).c_str());
    std::string value = utf8(buffer, static_cast<int>(n));
    if (value.size() > kMaxValue) value.resize(kMaxValue);
    return value;
}

bool ProfileFile::write(const std::string& section, const std::string& key, const std::string& value) const {
    if (path_.empty() || !writable(section, key, value)) return false;
    return WritePrivateProfileStringW(name(section).c_str(), name(key).c_str(), wide(value).c_str(),
                                      wide(path_).c_str()) != 0;
}

}  // namespace ulvetta
