#!/usr/bin/env bash
# Installs the Debian packages the project builds with; does nothing when all are present.
set -euo pipefail
packages=(
  build-essential cmake ninja-build ccache pkg-config
  libtbb-dev libpng-dev libjpeg-dev libtiff-dev
  libgtest-dev libgmock-dev libbenchmark-dev libcli11-dev libhwy-dev
)
# OpenCV is only a peer in benchmarks and cross-check tests.
if [ "${VARNOTH_WITH_OPENCV:-1}" = 1 ]; then
  packages+=(libopencv-dev)
fi
missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed' || missing+=("$p")
done
[ ${#missing[@]} -eq 0 ] && exit 0
echo "Installing: ${missing[*]}"
SUDO=""
[ "$(id -u)" -ne 0 ] && SUDO=sudo
$SUDO apt-get update -qq
DEBIAN_FRONTEND=noninteractive $SUDO apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null
