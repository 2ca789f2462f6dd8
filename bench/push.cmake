# Starts a real vmqd and vmqctl.
vmq_bench(push_bench SOURCES push_bench.cpp ../tests/support/daemon_process.cpp LIBRARIES vmqctl_objects)
target_compile_definitions(push_bench PRIVATE VMQ_DAEMON="$<TARGET_FILE:vmqd>" VMQ_CLIENT="$<TARGET_FILE:vmqctl>")
add_dependencies(push_bench vmqd vmqctl vmq)
