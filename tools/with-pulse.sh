#!/usr/bin/env bash
# Runs a command with a private PulseAudio daemon of its own: a null sink "md_sink" (the
# default sink, whose monitor tests capture) and a source "md_mic" remapped from that monitor
# (the default source), in a fresh runtime folder, so that parallel runs never share a server
# and no sound card is needed. Works as root (CI) and as a normal user. The daemon is stopped
# and its folder removed when the command ends; the command's exit code is returned.
#
#   tools/with-pulse.sh COMMAND [ARGUMENTS...]
set -euo pipefail
if [ $# -eq 0 ]; then
  echo "usage: $0 COMMAND [ARGUMENTS...]" >&2
  exit 2
fi
if ! command -v pulseaudio >/dev/null || ! command -v pactl >/dev/null; then
  echo "$0: pulseaudio and pulseaudio-utils are needed (bash tools/install-deps.sh installs them)" >&2
  exit 1
fi

export XDG_RUNTIME_DIR="$(mktemp -d "${TMPDIR:-/tmp}/md-run.XXXXXX")"   # mktemp makes it 0700
export PULSE_SERVER="unix:$XDG_RUNTIME_DIR/pulse/native"
# The daemon keeps its state and cookie here rather than in the user's home.
export HOME="$XDG_RUNTIME_DIR"

# norewinds: without it the monitor loses the first fragment of a new stream and a new
# capture stream's first read blocks for up to 1.6 s.
cat > "$XDG_RUNTIME_DIR/ci.pa" <<'PA'
load-module module-native-protocol-unix auth-anonymous=1
load-module module-null-sink sink_name=md_sink rate=44100 channels=1 norewinds=1 sink_properties=device.description=MelodriftNull
load-module module-remap-source source_name=md_mic master=md_sink.monitor source_properties=device.description=MelodriftMic
set-default-sink md_sink
set-default-source md_mic
PA
pulseaudio -n -F "$XDG_RUNTIME_DIR/ci.pa" --daemonize=no --exit-idle-time=-1 \
  --enable-memfd=no --log-target=file:"$XDG_RUNTIME_DIR/pulse.log" </dev/null &
PA_PID=$!
cleanup() {
  kill "$PA_PID" 2>/dev/null || true
  wait "$PA_PID" 2>/dev/null || true
  rm -rf "$XDG_RUNTIME_DIR"
}
trap cleanup EXIT

for _ in $(seq 50); do
  pactl info >/dev/null 2>&1 && break
  sleep 0.1
done
if ! pactl info >/dev/null 2>&1; then
  echo "$0: the private PulseAudio daemon did not start:" >&2
  cat "$XDG_RUNTIME_DIR/pulse.log" >&2 || true
  exit 1
fi

set +e
"$@"
status=$?
set -e
exit $status
