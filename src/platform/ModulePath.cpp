#include "platform/ModulePath.h"

namespace ulvetta {

std::string moduleDirectory() {
    std::string path = modulePath();
    // Both separators count: the module may be handed a Windows path even on POSIX hosts (Wine).
    std::string::size_type cut = path.find_last_of("/\\:");
    if (cut == std::string::npos) return std::string();
    return path.substr(0, cut + 1);
}

}  // namespace ulvetta
