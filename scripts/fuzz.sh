#!/usr/bin/env bash
# Builds the libFuzzer target in the sanitized tree (build-asan) and runs it over a copy of the
# seed corpus. Usage: scripts/fuzz.sh [SECONDS] (default 60). Fails on any crash, leak or
# sanitizer report; what failed is kept in build-asan/findings.
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}

bash scripts/configure-sanitized.sh
cmake --build build-asan --target SamlTokenFuzz -j "$(nproc)"

corpus=$(mktemp -d)
trap 'rm -rf "$corpus"' EXIT
cp tests/data/tokens/*.xml "$corpus/"
mkdir -p build-asan/findings
ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 \
  build-asan/fuzz/SamlTokenFuzz "$corpus" -max_total_time="$seconds" -max_len=65536 -timeout=10 -rss_limit_mb=2048 \
  -artifact_prefix=build-asan/findings/ -print_final_stats=1
