// Library-internal services shared by the spectral routines: failure reporting and 32-byte aligned memory.
#pragma once

#include <cstddef>

namespace ulvetta {
namespace spectral {

// Stores status as the library's last status and calls the installed error handler.
void report(int status, const char* routine, const char* message);

constexpr std::size_t kAlign = 32;

// count bytes aligned to kAlign, or null when the memory is not available. Never throws.
void* alignedAlloc(std::size_t bytes);
void alignedFree(void* p);

}  // namespace spectral
}  // namespace ulvetta
