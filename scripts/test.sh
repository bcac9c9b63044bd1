#!/usr/bin/env bash
# Builds everything and runs every test suite: plainly, then under AddressSanitizer and
# UndefinedBehaviorSanitizer in a second build tree, the concurrent suites under ThreadSanitizer
# in a third, then fuzzes the token parser. Exits non-zero on any failure or report.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

jobs=$(nproc)

echo "== Plain build ($(date +%T))"
cmake -S . -B build -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build -j "$jobs"
ctest --test-dir build --output-on-failure -j "$jobs"

echo "== AddressSanitizer + UndefinedBehaviorSanitizer build ($(date +%T))"
bash scripts/configure-sanitized.sh
cmake --build build-asan -j "$jobs"
ASAN_OPTIONS=detect_leaks=1:abort_on_error=0:halt_on_error=1 \
UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1 \
  ctest --test-dir build-asan --output-on-failure -j "$jobs"

echo "== ThreadSanitizer build, the suites that run work on several threads ($(date +%T))"
concurrent_suites=(
  RefTest LoggingTest ThreadPoolTest UserAgentTest
  LoggerTest HttpsClientTest AsyncOperationsTest GssNegotiationTest SecurityTokenServiceImplTest
)
for suite in tests/e2e/*Test.cpp; do
  [ -e "$suite" ] && concurrent_suites+=("$(basename "$suite" .cpp)")
done
cmake -S . -B build-tsan -DCMAKE_BUILD_TYPE=Debug -DCMAKE_C_FLAGS_DEBUG="-O1 -g1" -DCMAKE_CXX_FLAGS_DEBUG="-O1 -g1" \
  -DSSOCLIENT_TSAN=ON >/dev/null
cmake --build build-tsan -j "$jobs" --target "${concurrent_suites[@]}"
for suite in "${concurrent_suites[@]}"; do
  echo "-- $suite"
  # The size-limit cases move 16 MiB through one thread: slow under ThreadSanitizer, nothing to race.
  TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1 "build-tsan/tests/$suite" --gtest_brief=1 \
    --gtest_filter='-*SizeLimit*:*Oversized*'
done

echo "== Fuzzing the token parser for 60 seconds, the canonicalisation for 30 ($(date +%T))"
bash scripts/fuzz.sh 60 SamlTokenFuzz
bash scripts/fuzz.sh 30 ExclusiveCanonicalFuzz
echo "== All passed ($(date +%T))"
