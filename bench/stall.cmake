# What parameter changes cost the stream: the worst block while another thread changes parameters, and
# the time of one response preparation per rate.
ulvetta_add_bench(stall_bench SOURCES ParameterStallBench.cpp LIBS ulvetta_core)
