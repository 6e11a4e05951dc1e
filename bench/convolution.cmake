# The convolution reverbs: real-time factors at several rates and block sizes, the time of one response
# preparation, and the same stereo convolution by zita-convolver (a benchmark-only peer) side by side.
find_path(ZITA_CONVOLVER_INCLUDE zita-convolver.h REQUIRED)
find_library(ZITA_CONVOLVER_LIB zita-convolver REQUIRED)
find_package(Threads REQUIRED)
ulvetta_add_bench(convolution_bench SOURCES ConvolutionBench.cpp
                  LIBS ulvetta_core ${ZITA_CONVOLVER_LIB} Threads::Threads)
target_include_directories(convolution_bench PRIVATE ${ZITA_CONVOLVER_INCLUDE})
