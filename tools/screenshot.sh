#!/usr/bin/env bash
# Starts the desktop program on a virtual X display (Xvfb), opening FILE when one is given,
# and saves a PNG of the whole screen, so anyone can see what a user sees. Settings and
# working files of the run live in a temporary folder and are removed afterwards.
#
#   tools/screenshot.sh [-o OUT.png] [-s WIDTHxHEIGHT] [-w SECONDS] [-b BUILD_DIR] [FILE]
#
# Needs xvfb, xauth and imagemagick (tools/install-deps.sh installs them) and a build of
# `melodrift` (default: build/app/melodrift).
set -euo pipefail
top="$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)"
out="melodrift-screenshot.png"
size="1920x1080"
wait_seconds=5
build="$top/build"

usage() { sed -n '2,9p' "${BASH_SOURCE[0]}" | sed 's/^# \{0,1\}//'; }
while getopts "o:s:w:b:h" option; do
  case "$option" in
    o) out="$OPTARG" ;;
    s) size="$OPTARG" ;;
    w) wait_seconds="$OPTARG" ;;
    b) build="$OPTARG" ;;
    h) usage; exit 0 ;;
    *) usage >&2; exit 2 ;;
  esac
done
shift $((OPTIND - 1))

program="$build/app/melodrift"
if [ ! -x "$program" ]; then
  echo "screenshot.sh: $program not found; build first (cmake --build $build)" >&2
  exit 1
fi
for tool in xvfb-run xauth import; do
  if ! command -v "$tool" >/dev/null; then
    echo "screenshot.sh: $tool is missing; run tools/install-deps.sh" >&2
    exit 1
  fi
done
if ! [[ "$size" =~ ^[0-9]+x[0-9]+$ ]]; then
  echo "screenshot.sh: size must look like 1920x1080" >&2
  exit 2
fi
files=()
for file in "$@"; do
  [ -e "$file" ] || { echo "screenshot.sh: $file does not exist" >&2; exit 1; }
  files+=("$(cd "$(dirname "$file")" && pwd)/$(basename "$file")")
done
case "$out" in /*) ;; *) out="$PWD/$out" ;; esac

run="$(mktemp -d -t melodrift-shot.XXXXXX)"
trap 'rm -rf "$run"' EXIT
mkdir -m 700 "$run/xdg"
export XDG_RUNTIME_DIR="$run/xdg"
unset QT_QPA_PLATFORM

# Without a window manager nothing maximizes the frame, so its first geometry is the screen.
xvfb-run -a -s "-screen 0 ${size}x24 -nolisten tcp" bash -c '
  program="$1" run="$2" size="$3" wait_seconds="$4" out="$5"
  shift 5
  "$program" -qwindowgeometry "${size}+0+0" --shared "$run" --config "$run/config" "$@" \
    >"$run/program.log" 2>&1 &
  pid=$!
  sleep "$wait_seconds"
  if ! kill -0 "$pid" 2>/dev/null; then
    echo "screenshot.sh: melodrift ended early:" >&2
    cat "$run/program.log" >&2
    exit 1
  fi
  import -window root "$out"
  kill "$pid"
  wait "$pid" 2>/dev/null || true
' screenshot "$program" "$run" "$size" "$wait_seconds" "$out" "${files[@]}"
echo "$out"
