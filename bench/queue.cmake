vmq_bench(queue_bench SOURCES queue_bench.cpp)
