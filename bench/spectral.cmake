# Real-FFT pairs of our FFT library (ulvetta_spectral) against FFTW 3 (single precision) and KissFFT, side by side.
# Both peers are benchmark-only dependencies; the module never links them.
find_package(PkgConfig REQUIRED)
pkg_check_modules(FFTW3F REQUIRED IMPORTED_TARGET fftw3f)
pkg_check_modules(KISSFFT REQUIRED IMPORTED_TARGET kissfft-float)
ulvetta_add_bench(spectral_bench SOURCES SpectralBench.cpp
                  LIBS ulvetta_spectral PkgConfig::FFTW3F PkgConfig::KISSFFT)
