vmq_bench(deployment_bench SOURCES deployment_bench.cpp)
