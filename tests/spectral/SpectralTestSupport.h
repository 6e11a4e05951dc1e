// Helpers of the spectral tests: seeded random data, the unit circle for direct transforms in double
// precision, the RCPerm layout, and the instruction sets to run each check on.
#pragma once

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <random>
#include <vector>

#include "spectral/FftTables.h"
#include "spectral/Nsp.h"

namespace spectral_test {

constexpr double kEps = 5.9604644775390625e-08;  // 2^-24, float rounding unit

// Seed from SPECTRAL_SEED when set, so that a failing run can be repeated.
inline unsigned seed(unsigned fallback) {
    const char* s = std::getenv("SPECTRAL_SEED");
    return s ? static_cast<unsigned>(std::strtoul(s, nullptr, 10)) : fallback;
}

inline std::vector<float> randomFloats(std::size_t n, unsigned s, float lo = -1.0f, float hi = 1.0f) {
    std::mt19937 gen(s);
    std::uniform_real_distribution<float> d(lo, hi);
    std::vector<float> v(n);
    for (auto& x : v) x = d(gen);
    return v;
}

// cos and sin of 2 pi j / n for j < n, from long double.
struct UnitCircle {
    std::vector<double> c, s;
    explicit UnitCircle(std::size_t n) : c(n), s(n) {
        for (std::size_t j = 0; j < n; ++j) {
            const long double a = 6.283185307179586476925286766559L * j / n;
            c[j] = static_cast<double>(std::cos(a));
            s[j] = static_cast<double>(std::sin(a));
        }
    }
};

// Real and imaginary part of bin k (0 <= k <= N/2) of a spectrum stored in RCPerm.
inline float permRe(const float* x, std::size_t n, std::size_t k) {
    return k == 0 ? x[0] : k == n / 2 ? x[1] : x[2 * k];
}
inline float permIm(const float* x, std::size_t n, std::size_t k) { return k == 0 || k == n / 2 ? 0.0f : x[2 * k + 1]; }

// Selects an instruction set for one scope and restores the previous one.
class IsaScope {
public:
    explicit IsaScope(ulvetta::spectral::Isa isa) : before_(ulvetta::spectral::activeIsa()) {
        ok_ = ulvetta::spectral::selectIsa(isa);
    }
    ~IsaScope() { ulvetta::spectral::selectIsa(before_); }
    bool ok() const { return ok_; }

private:
    ulvetta::spectral::Isa before_;
    bool ok_;
};

// The instruction sets this build and processor can run.
inline std::vector<ulvetta::spectral::Isa> availableIsas() {
    using ulvetta::spectral::Isa;
    std::vector<Isa> out;
    for (Isa i : {Isa::Scalar, Isa::Sse2, Isa::Avx2})
        if (IsaScope(i).ok()) out.push_back(i);
    return out;
}

}  // namespace spectral_test
