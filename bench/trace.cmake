vmq_bench(trace_bench SOURCES trace_bench.cpp)
