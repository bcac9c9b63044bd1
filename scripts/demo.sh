#!/usr/bin/env bash
# Builds the library and its command-line tool, then runs the demo.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

cmake -S . -B build -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build -j "$(nproc)" --target ssoclient_cli
./build/tools/cli/ssoclient demo "$@"
