#!/bin/sh
# melodrift-cli record end to end.
#   recordCommandTest.sh MELODRIFT_CLI DEMO_WAVE feeder
#       the demo fed in place of a microphone: the song holds its samples, the notes are written;
#       without a sound server the default input is refused with the program's message
#   recordCommandTest.sh MELODRIFT_CLI DEMO_WAVE server
#       run through tools/with-pulse.sh: the demo played into the null sink is recorded from the
#       default source
set -u
cli=$1
wave=$2
mode=$3
work=$(mktemp -d "${TMPDIR:-/tmp}/melodrift-record-test.XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
failures=0
fail() {
    echo "FAIL: $*" >&2
    failures=$((failures + 1))
}
run() { "$cli" --shared "$work" --config "$work/config" "$@"; }
loudSamples() { od -An -v -j 44 -td2 -w2 "$1" | awk '$1 > 1000 || $1 < -1000 { n++ } END { print n + 0 }'; }

run record "$work/x.wav" >/dev/null 2>&1
[ $? -eq 2 ] || fail "record without --seconds is a usage error"

if [ "$mode" = feeder ]; then
    run record "$work/take.wav" --seconds 5 --from-file "$wave" --fast --notes-csv "$work/notes.csv" \
        --midi "$work/take.mid" >"$work/out.txt" 2>"$work/err.txt" || fail "feeder: exit $?: $(cat "$work/err.txt")"
    grep -q "^Recording $wave at 44100 Hz, 16-bit for 5.0 s$" "$work/out.txt" || fail "feeder: $(cat "$work/out.txt")"
    # Five seconds and a little more (the last stretch), sample for sample the demo's.
    bytes=$(($(wc -c <"$work/take.wav") - 44))
    [ "$bytes" -ge 441000 ] && [ "$bytes" -lt 500000 ] || fail "feeder: $bytes bytes of audio"
    cmp -s -n 441000 -i 44:44 "$work/take.wav" "$wave" || fail "feeder: the recording differs from what was fed"
    [ "$(head -n 1 "$work/notes.csv")" = "onset_s,offset_s,midi_pitch,pitch_hz,volume_sum" ] || fail "feeder: notes header"
    [ "$(wc -l <"$work/notes.csv")" -ge 6 ] || fail "feeder: $(($(wc -l <"$work/notes.csv") - 1)) notes in 5 s of the demo"
    [ "$(head -c 4 "$work/take.mid")" = "MThd" ] || fail "feeder: no MIDI file"

    PULSE_SERVER="unix:$work/no-such-socket" run record "$work/none.wav" --seconds 1 >/dev/null 2>"$work/err.txt"
    [ $? -eq 1 ] || fail "without a server the default input is refused"
    grep -q "Sorry - DirectSound does not appear to be available for recording" "$work/err.txt" ||
        fail "without a server: $(cat "$work/err.txt")"
    [ ! -e "$work/none.wav" ] || fail "without a server a file was written"
    exit $failures
fi

# The demo played into the sink while the default source (its monitor) is recorded.
(sleep 0.5 && paplay --device=md_sink "$wave") &
player=$!
run record "$work/take.wav" --seconds 4 >"$work/out.txt" 2>"$work/err.txt" || fail "server: exit $?: $(cat "$work/err.txt")"
kill $player 2>/dev/null
wait $player 2>/dev/null
grep -q "^Recording the default input at 44100 Hz, 16-bit for 4.0 s$" "$work/out.txt" || fail "server: $(cat "$work/out.txt")"
loud=$(loudSamples "$work/take.wav")
[ "$loud" -gt 44100 ] || fail "server: only $loud loud samples were recorded"
[ -z "$(ls "$work/Torvellan Shared" 2>/dev/null)" ] || fail "files left: $(ls "$work/Torvellan Shared")"
exit $failures
