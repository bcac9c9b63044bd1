#!/usr/bin/env bash
# Installs a built tree into a temporary prefix and builds the consumer against it twice: with
# CMake's find_package and with pkg-config and plain g++. Then runs both consumers and every
# installed tool.
# Usage: check-install.sh BUILD_DIR LIBDIR "EXTRA_CXXFLAGS"
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
build=$1
libdir=$2
flags=$3
certificate=$here/../data/keys/sts.pem

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix

fail() {
  echo "FAILED: $*" >&2
  exit 1
}

cmake --install "$build" --prefix "$prefix" >/dev/null

for library in ssoclient tamber; do
  soname=$(readelf -d "$prefix/$libdir/lib$library.so" | sed -n 's/.*Library soname: \[\(.*\)\]/\1/p')
  [ "$soname" = "lib$library.so.0" ] || fail "lib$library.so has soname '$soname', expected lib$library.so.0"
done
for header in ssoClient/ssoClient.h tamber/tamber.h tamber/xml/security/Signature.h; do
  [ -f "$prefix/include/$header" ] || fail "header $header is not installed"
done

echo "== find_package(SsoClient)"
cmake -S "$here/consumer" -B "$work/cmake-consumer" -DCMAKE_PREFIX_PATH="$prefix" \
  -DCMAKE_CXX_FLAGS="$flags" -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build "$work/cmake-consumer" >/dev/null
"$work/cmake-consumer/Consumer" "$certificate"

echo "== pkg-config ssoclient"
export PKG_CONFIG_PATH=$prefix/$libdir/pkgconfig
[ "$(pkg-config --modversion ssoclient)" = "0.1.0" ] || fail "pkg-config reports version $(pkg-config --modversion ssoclient)"
# shellcheck disable=SC2046,SC2086 # the flags are lists of words
g++ -std=c++17 $flags "$here/consumer/Consumer.cpp" -o "$work/pkg-config-consumer" \
  $(pkg-config --cflags --libs ssoclient) -Wl,-rpath,"$(pkg-config --variable=libdir ssoclient)"
"$work/pkg-config-consumer" "$certificate"

echo "== installed tools"
for tool in "$prefix"/bin/*; do
  [ -e "$tool" ] || continue
  # As installed, without any library path from the environment.
  env -u LD_LIBRARY_PATH "$tool" --help >/dev/null || fail "installed $tool --help failed"
  echo "$(basename "$tool") runs"
done
echo "installed package OK"
