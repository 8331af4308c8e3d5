#!/bin/sh
# Installs the Debian packages the build, the tests, the fuzzers and the
# benchmarks need, when any is missing. Needs root (or sudo) only then.
set -eu
packages="cmake make g++ clang libclang-rt-14-dev pkg-config binutils libgtest-dev
libbenchmark-dev liblcms2-dev libgs-common libvips-tools libcairo2-dev libcli11-dev
libpng-dev libtiff-dev libxml2-dev nlohmann-json3-dev"
missing=""
for p in $packages; do
  if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed'; then
    missing="$missing $p"
  fi
done
[ -z "$missing" ] && exit 0
echo "installing:$missing"
if [ "$(id -u)" -eq 0 ]; then
  SUDO=""
elif command -v sudo >/dev/null 2>&1; then
  SUDO="sudo"
else
  echo "missing packages:$missing (run as root to install them)" >&2
  exit 1
fi
export DEBIAN_FRONTEND=noninteractive
$SUDO apt-get update -q
# shellcheck disable=SC2086
$SUDO apt-get install -y -q --no-install-recommends $missing
