vmq_bench(code_pages_bench SOURCES code_pages_bench.cpp)
