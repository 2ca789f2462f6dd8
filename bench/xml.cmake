pkg_check_modules(EXPAT REQUIRED IMPORTED_TARGET expat)
vmq_bench(xml_bench SOURCES xml_bench.cpp LIBRARIES PkgConfig::EXPAT)
