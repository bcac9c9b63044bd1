#!/usr/bin/env bash
# Builds the libFuzzer targets in the sanitized tree (build-asan) and runs each over a copy of its
# seed corpus. Usage: scripts/fuzz.sh [SECONDS [TARGET...]] (default 60 seconds for each of
# SamlTokenFuzz and ExclusiveCanonicalFuzz). Fails on any crash, leak or sanitizer report; what
# failed is kept in build-asan/findings.
set -euo pipefail
cd "$(dirname "$0")/.."
seconds=${1:-60}
shift || true
targets=("$@")
[ ${#targets[@]} -gt 0 ] || targets=(SamlTokenFuzz ExclusiveCanonicalFuzz)

bash scripts/configure-sanitized.sh
cmake --build build-asan --target "${targets[@]}" -j "$(nproc)"
mkdir -p build-asan/findings

for target in "${targets[@]}"; do
  corpus=$(mktemp -d)
  cp tests/data/tokens/*.xml "$corpus/"
  # The canonicalisation also starts from the signature vectors: other shapes, other namespaces.
  [ "$target" = ExclusiveCanonicalFuzz ] && cp tests/data/xmlsec/*.xml "$corpus/"
  echo "-- $target for $seconds seconds"
  status=0
  ASAN_OPTIONS=detect_leaks=1:abort_on_error=1 UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 \
    "build-asan/fuzz/$target" "$corpus" -max_total_time="$seconds" -max_len=65536 -timeout=10 -rss_limit_mb=2048 \
    -artifact_prefix="build-asan/findings/$target-" -print_final_stats=1 || status=$?
  rm -rf "$corpus"
  [ "$status" -eq 0 ] || exit "$status"
done
