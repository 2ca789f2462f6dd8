# Starts a real vmqd, so it needs the program and the component.
vmq_bench(daemon_bench SOURCES daemon_bench.cpp ../tests/support/daemon_process.cpp)
target_compile_definitions(daemon_bench PRIVATE VMQ_DAEMON="$<TARGET_FILE:vmqd>")
add_dependencies(daemon_bench vmqd vmq)
