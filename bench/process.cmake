vmq_bench(process_bench SOURCES process_bench.cpp)
