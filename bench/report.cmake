# Makes one table of what the other programs have measured.
find_package(nlohmann_json REQUIRED)
add_executable(bench_report report.cpp report_rows.cpp)
target_link_libraries(bench_report PRIVATE nlohmann_json::nlohmann_json)
