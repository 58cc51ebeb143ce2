#!/usr/bin/env bash
# Installs everything Melodrift needs to build, run and test on Debian 12.
# Safe to run again: apt-get skips what is already there.
set -euo pipefail
export DEBIAN_FRONTEND=noninteractive
SUDO=""
if [ "$(id -u)" != 0 ]; then SUDO="sudo"; fi
packages=(
  cmake ninja-build g++ pkg-config
  clang libclang-rt-14-dev
  qt6-base-dev
  libfluidsynth-dev timgm6mb-soundfont
  pulseaudio pulseaudio-utils libpulse-dev
  fonts-dejavu-core fonts-liberation
  xvfb xauth imagemagick
  libgtest-dev libgmock-dev libbenchmark-dev libfftw3-dev
)
missing=()
for p in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed' || missing+=("$p")
done
if [ ${#missing[@]} -gt 0 ]; then
  $SUDO apt-get update
  $SUDO apt-get install -y --no-install-recommends -o DPkg::Lock::Timeout=600 "${missing[@]}"
fi
