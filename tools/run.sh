#!/usr/bin/env bash
# Installs what Melodrift needs, builds it and runs the main job on FILE, or on the bundled
# demo recording when no file is given. Working files and settings of this run stay in
# the build folder, so it never touches the user's own.
set -euo pipefail
top="$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)"
bash "$top/tools/install-deps.sh"
cmake -S "$top" -B "$top/build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo
cmake --build "$top/build" -j2
file="${1:-$top/build/demo/demo-melody.wav}"
mkdir -p "$top/build/run"
exec "$top/build/melodrift-cli" --shared "$top/build/run" --config "$top/build/run/config" info "$file"
