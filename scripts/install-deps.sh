#!/usr/bin/env bash
# Installs the Debian packages the project builds with; does nothing when all are present.
set -euo pipefail

packages=(
  cmake g++ make pkg-config ca-certificates openssl
  libxml2-dev libxmlsec1-dev libxmlsec1-openssl xmlsec1 libssl-dev libcurl4-openssl-dev
  libboost-dev libgtest-dev libgmock-dev libbenchmark-dev
  libcpp-httplib-dev nlohmann-json3-dev libcli11-dev
  clang libclang-rt-14-dev
)

missing=()
for package in "${packages[@]}"; do
  if ! dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q "install ok installed"; then
    missing+=("$package")
  fi
done

if [ ${#missing[@]} -gt 0 ]; then
  if [ "$(id -u)" -ne 0 ]; then
    echo "Missing packages: ${missing[*]}; run as root to install them." >&2
    exit 1
  fi
  echo "Installing: ${missing[*]}"
  export DEBIAN_FRONTEND=noninteractive
  apt-get update -qq
  apt-get install -y --no-install-recommends "${missing[@]}"
fi
