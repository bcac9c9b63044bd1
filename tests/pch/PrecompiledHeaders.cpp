// The translation unit that compiles the suites' precompiled headers (see tests/CMakeLists.txt).
