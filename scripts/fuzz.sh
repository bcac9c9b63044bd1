#!/usr/bin/env bash
# Builds the libFuzzer target in build-fuzz (clang, AddressSanitizer, UndefinedBehaviorSanitizer,
# fuzzer instrumentation on every library) and runs it over a copy of the seed corpus.
# Usage: scripts/fuzz.sh [SECONDS]   (default 60). Fails on any crash, leak or sanitizer report.
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}
flags="-fsanitize=fuzzer-no-link,address,undefined -fno-sanitize-recover=all -fno-omit-frame-pointer"

CC=clang CXX=clang++ cmake -S . -B build-fuzz -DCMAKE_BUILD_TYPE=RelWithDebInfo \
  -DSSOCLIENT_BUILD_FUZZ=ON -DSSOCLIENT_BUILD_TESTS=OFF \
  -DCMAKE_C_FLAGS="$flags" -DCMAKE_CXX_FLAGS="$flags" \
  -DCMAKE_EXE_LINKER_FLAGS="-fsanitize=address,undefined" >/dev/null
cmake --build build-fuzz --target SamlTokenFuzz -j2

corpus=$(mktemp -d)
trap 'rm -rf "$corpus"' EXIT
cp tests/data/tokens/*.xml "$corpus/"
mkdir -p build-fuzz/findings
ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 \
  build-fuzz/fuzz/SamlTokenFuzz "$corpus" -max_total_time="$seconds" -max_len=65536 -timeout=10 -rss_limit_mb=2048 \
  -artifact_prefix=build-fuzz/findings/ -print_final_stats=1
