// Library-wide status and error handler, and the aligned allocator of the tables and FIR buffers.
#include "spectral/NspContext.h"

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <new>

#include "spectral/Nsp.h"

namespace ulvetta {

namespace {

std::atomic<int> gStatus{NspStsOk};
std::atomic<NspErrorHandler> gHandler{&nspRecordErrorHandler};

}  // namespace

void nspRecordErrorHandler(int, const char*, const char*) {}

void nspExitErrorHandler(int status, const char* routine, const char* message) {
    std::fprintf(stderr, "%s: %s (%s)\n", routine ? routine : "?", nspErrorStr(status), message ? message : "");
    std::exit(1);
}

NspErrorHandler nspRedirectError(NspErrorHandler handler) {
    return gHandler.exchange(handler ? handler : &nspRecordErrorHandler);
}

int nspGetErrStatus() { return gStatus.load(); }

void nspSetErrStatus(int status) { gStatus.store(status); }

const char* nspErrorStr(int status) {
    switch (status) {
    case NspStsOk: return "No Error";
    case NspStsBacktrace: return "Backtrace";
    case NspStsBadState: return "Internal error (bad state)";
    case NspStsNoMem: return "Out of memory";
    case NspStsBadArg: return "Bad argument";
    case NspStsUnsupported: return "Unsupported function";
    case NspStsNoConv: return "Iteration convergence failed";
    case NspStsAutoTrace: return "Autotrace call";
    default: return "Unknown error or status code";
    }
}

namespace spectral {

void report(int status, const char* routine, const char* message) {
    gStatus.store(status);
    gHandler.load()(status, routine, message);
}

void* alignedAlloc(std::size_t bytes) {
    return ::operator new(bytes ? bytes : 1, std::align_val_t(kAlign), std::nothrow);
}

void alignedFree(void* p) {
    if (p) ::operator delete(p, std::align_val_t(kAlign));
}

}  // namespace spectral
}  // namespace ulvetta
