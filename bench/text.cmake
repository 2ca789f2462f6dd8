vmq_bench(bench_text SOURCES text_bench.cpp)
vmq_bench(bench_map SOURCES map_bench.cpp)
