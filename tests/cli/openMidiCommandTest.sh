#!/bin/sh
# melodrift-cli open on a MIDI file end to end: the demo's MIDI file read into notes that match
# the demo's true notes, saved as MIDI and read back to the same notes, and the refusals of a
# wave output for a song of notes and of a file that is no MIDI file.
#
#   openMidiCommandTest.sh MELODRIFT_CLI DEMO_MIDI
set -u
cli=$1
midi=$2
truth=${midi%.mid}.notes.csv
test_name=melodrift-cli-midi
. "$(dirname "$0")/cliTestSupport.sh"

run open "$midi" --notes-csv "$work/notes.csv" --midi "$work/again.mid" >"$work/out.txt" 2>"$work/err.txt" \
    || fail "open of the demo's MIDI file exited with $?: $(cat "$work/err.txt")"
[ "$(head -n 1 "$work/notes.csv")" = "onset_s,offset_s,midi_pitch,pitch_hz,volume_sum" ] \
    || fail "notes header: $(head -n 1 "$work/notes.csv")"
grep -q "^Notes: 21, from C4 to A4$" "$work/out.txt" || fail "summary: $(cat "$work/out.txt")"

# The file's notes are the true notes: the same keys, lengths and spacing (the recording starts
# its first note later than the file does).
awk -F, 'FNR == 1 { next }
    FILENAME == ARGV[1] { on[++n] = $1; off[n] = $2; key[n] = $3; next }
    { m++; if (m == 1) shift = on[1] - $1
      d = $1 + shift - on[m]; e = $2 + shift - off[m]
      if (d > 0.002 || d < -0.002 || e > 0.002 || e < -0.002 || $3 != key[m]) { print "note " m ": " $0; bad++ } }
    END { if (m != n) { print m " notes read, " n " true"; bad++ } exit bad > 0 }' "$truth" "$work/notes.csv" \
    || fail "notes against the truth"

# The program's own file reads back to the same keys, each time within a tick (1/512 s).
run open "$work/again.mid" --notes-csv "$work/again.csv" >/dev/null 2>"$work/err2.txt" \
    || fail "open of the written MIDI file exited with $?: $(cat "$work/err2.txt")"
awk -F, 'FNR == 1 { next }
    FILENAME == ARGV[1] { on[++n] = $1; off[n] = $2; key[n] = $3; next }
    { m++; d = $1 - on[m]; e = $2 - off[m]
      if (d > 0.002 || d < -0.002 || e > 0.002 || e < -0.002 || $3 != key[m]) { print "note " m ": " $0; bad++ } }
    END { if (m != n) { print m " notes read back, " n " written"; bad++ } exit bad > 0 }' "$work/notes.csv" "$work/again.csv" \
    || fail "round trip through the program's own MIDI file"

# A song of notes has no wave to write; a file without "MThd" says which file and why.
run open "$midi" --wave "$work/x.wav" >/dev/null 2>&1
[ $? -eq 2 ] || fail "--wave with a MIDI file is not refused as a usage error"
[ ! -e "$work/x.wav" ] || fail "a wave file was written for a song of notes"
printf 'RIFF....WAVE' >"$work/fake.mid"
run open "$work/fake.mid" --notes-csv "$work/fake.csv" >/dev/null 2>"$work/err3.txt"
[ $? -eq 1 ] || fail "a file that is no MIDI file does not fail"
grep -q "This is not a MIDI file and cannot be opened." "$work/err3.txt" || fail "message: $(cat "$work/err3.txt")"
grep -q "fake.mid: it does not begin with \"MThd\"." "$work/err3.txt" || fail "reason: $(cat "$work/err3.txt")"
[ ! -e "$work/fake.csv" ] || fail "a notes table was written for a refused file"

[ $failures -eq 0 ] && echo "openMidiCommandTest: all checks passed"
exit $failures
