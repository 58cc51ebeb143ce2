#!/bin/sh
# melodrift-cli play end to end on the demo recording.
#   playCommandTest.sh MELODRIFT_CLI DEMO_WAVE no-server
#       no sound server: one clear message, exit code 1, no wait
#   playCommandTest.sh MELODRIFT_CLI DEMO_WAVE server
#       run through tools/with-pulse.sh: Wave and MIDI mode are heard at the null sink's monitor
#       and last as long as the stretch; a server that goes away ends playback, it does not hang
set -u
cli=$1
wave=$2
mode=$3
work=$(mktemp -d "${TMPDIR:-/tmp}/melodrift-play-test.XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
failures=0
fail() {
    echo "FAIL: $*" >&2
    failures=$((failures + 1))
}
run() { "$cli" --shared "$work" --config "$work/config" "$@"; }
now() { date +%s%N; }
elapsedMs() { echo $(( ($(now) - $1) / 1000000 )); }

run play "$wave" --from 2 --to 1 >/dev/null 2>&1
[ $? -eq 2 ] || fail "--to before --from is a usage error"

if [ "$mode" = no-server ]; then
    begun=$(now)
    PULSE_SERVER="unix:$work/no-such-socket" run play "$wave" >"$work/out.txt" 2>"$work/err.txt"
    status=$?
    [ $status -eq 1 ] || fail "without a server the exit code is $status"
    grep -q "The sound server is not running or cannot be reached" "$work/err.txt" ||
        fail "without a server: $(cat "$work/err.txt")"
    [ "$(grep -c 'Message from' "$work/err.txt")" -eq 1 ] || fail "one message, not: $(cat "$work/err.txt")"
    [ "$(elapsedMs "$begun")" -lt 10000 ] || fail "without a server it took $(elapsedMs "$begun") ms"
    [ -z "$(ls "$work/Torvellan Shared" 2>/dev/null)" ] || fail "files left: $(ls "$work/Torvellan Shared")"
    exit $failures
fi

# Plays a stretch while the monitor is recorded; checks the time taken and that sound arrived.
playHeard() {
    what=$1
    shift
    parec --device=md_sink.monitor --format=s16le --rate=44100 --channels=1 --raw >"$work/heard.raw" &
    recorder=$!
    sleep 0.2
    begun=$(now)
    run play "$wave" "$@" >"$work/out.txt" 2>"$work/err.txt" || fail "$what: exit $?: $(cat "$work/err.txt")"
    took=$(elapsedMs "$begun")
    sleep 0.2
    kill $recorder
    wait $recorder 2>/dev/null
    grep -q "^Playing .* in $what mode from 0:01.00 to 0:03.00$" "$work/out.txt" || fail "$what: $(cat "$work/out.txt")"
    # Opening the demo takes a moment; the two seconds must be played in full.
    [ "$took" -ge 2000 ] && [ "$took" -lt 15000 ] || fail "$what: two seconds played in $took ms"
    loud=$(od -An -v -td2 -w2 "$work/heard.raw" | awk '$1 > 1000 || $1 < -1000 { n++ } END { print n + 0 }')
    [ "$loud" -gt 22050 ] || fail "$what: only $loud loud samples were heard"
}
playHeard Wave --from 1 --to 3
playHeard MIDI --from 1 --to 3 --midi
[ -z "$(ls "$work/Torvellan Shared" 2>/dev/null)" ] || fail "files left: $(ls "$work/Torvellan Shared")"

# The server goes away one second into the song: playback ends, the tool does not wait on.
run play "$wave" >"$work/out.txt" 2>"$work/err.txt" &
player=$!
sleep 2.5
begun=$(now)
pactl exit
waited=0
while kill -0 $player 2>/dev/null && [ $waited -lt 50 ]; do
    sleep 0.1
    waited=$((waited + 1))
done
if kill -0 $player 2>/dev/null; then
    fail "still playing $(elapsedMs "$begun") ms after the server went away"
    kill $player
fi
wait $player 2>/dev/null
exit $failures
