// Where the running module (the shared object or executable holding this code) lives on disk.
#pragma once

#include <string>

namespace ulvetta {

// Full path of the module file; empty when the platform cannot tell.
std::string modulePath();
// The module's folder, with a trailing separator: the module path with everything after its last
// separator removed.
std::string moduleDirectory();

}  // namespace ulvetta
