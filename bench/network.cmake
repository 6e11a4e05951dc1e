# Real-time factors of the delay-network algorithms (plates, extended plates, diffused echo).
ulvetta_add_bench(network_bench SOURCES NetworkBench.cpp LIBS ulvetta_dsp)
