#!/usr/bin/env bash
# Installs the Debian packages the project needs, if any is missing (Debian 12), and any package named as an
# argument (scripts/setup.sh adds gnuplot-nox, for the benchmark's plot). Needs root or sudo.
# ninja-build and man-db serve the install check and the manual page's test.
set -euo pipefail

packages=(cmake make ninja-build g++ libgtest-dev libbenchmark-dev libpython3-dev pkg-config m4 man-db "$@")
missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed' || missing+=("$p")
done
[ ${#missing[@]} -eq 0 ] && exit 0

echo "Installing: ${missing[*]}"
sudo=""
[ "$(id -u)" -eq 0 ] || sudo="sudo"
export DEBIAN_FRONTEND=noninteractive
$sudo apt-get update -q
$sudo apt-get install -y -q --no-install-recommends "${missing[@]}"
