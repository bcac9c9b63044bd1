#!/usr/bin/env bash
# Configures build-asan: clang with AddressSanitizer and UndefinedBehaviorSanitizer on every
# target, plus libFuzzer's coverage instrumentation so that the same tree builds the unit tests
# and the fuzz targets. Used by test.sh and fuzz.sh.
set -euo pipefail
cd "$(dirname "$0")/.."

# Line tables are all the sanitizers' reports need; full debug information only slows the build.
CC=clang CXX=clang++ cmake -S . -B build-asan -DCMAKE_BUILD_TYPE=Debug \
  -DCMAKE_C_FLAGS_DEBUG=-gline-tables-only -DCMAKE_CXX_FLAGS_DEBUG=-gline-tables-only \
  -DSSOCLIENT_SANITIZE=ON -DSSOCLIENT_BUILD_FUZZ=ON >/dev/null
