#!/bin/sh
# melodrift-cli analyse end to end on the demo recording: the CSV files' exact headers and
# layout, the notes against the demo's true notes, the pitch track on the notes' steady
# parts, and the refusals of a bad command line and of a file that is no wave.
#
#   analyseCommandTest.sh MELODRIFT_CLI DEMO_WAVE
set -u
cli=$1
wave=$2
truth=${wave%.wav}.notes.csv
test_name=melodrift-cli-test
. "$(dirname "$0")/cliTestSupport.sh"

run analyse "$wave" --notes-csv "$work/notes.csv" --pitch-csv "$work/pitch.csv" --ft-csv "$work/ft.csv" \
    >"$work/out.txt" 2>"$work/err.txt" || fail "analyse of the demo exited with $?: $(cat "$work/err.txt")"

[ "$(head -n 1 "$work/notes.csv")" = "onset,offset,midi_pitch,pitch_hz,volume" ] || fail "notes header: $(head -n 1 "$work/notes.csv")"
[ "$(head -n 1 "$work/pitch.csv")" = "time,hz" ] || fail "pitch header: $(head -n 1 "$work/pitch.csv")"
[ "$(head -n 1 "$work/ft.csv")" = "block,time_s,loudness,frequency_hz,amplitude" ] || fail "FT header: $(head -n 1 "$work/ft.csv")"

# One pitch row per whole block of 512 samples at 44,100 Hz (680,917 samples: 1,329 blocks), at
# the block's middle.
awk -F, 'NR > 1 {
        n++
        expected = (n - 0.5) * 512 / 44100
        if ($1 - expected > 0.000002 || expected - $1 > 0.000002) { print "row " n " at " $1 ", expected " expected; bad++ }
        if ($2 < 0) { print "row " n " has a negative pitch"; bad++ }
    }
    END { if (n != 1329) { print n " pitch rows, expected 1329"; bad++ } exit bad > 0 }' "$work/pitch.csv" \
    || fail "pitch rows"

# Notes in time order; midi_pitch is the fractional MIDI number of pitch_hz (A = 440 Hz); the
# volume is a mean block amplitude.
awk -F, 'NR > 1 {
        n++
        if (!($1 < $2)) { print "note " n " ends before it starts"; bad++ }
        if (n > 1 && $1 < last) { print "note " n " starts before the one before"; bad++ }
        last = $1
        midi = 69 + 12 * log($4 / 440) / log(2)
        if (midi - $3 > 0.001 || $3 - midi > 0.001) { print "note " n ": midi_pitch " $3 " for " $4 " Hz"; bad++ }
        if (!($5 > 0 && $5 <= 255)) { print "note " n ": volume " $5; bad++ }
    }
    END { if (n == 0) { print "no notes"; bad++ } exit bad > 0 }' "$work/notes.csv" || fail "note rows"

# Every true note is found: onset within 0.05 s, pitch within half a semitone.
awk -F, 'FNR == 1 { next }
    FILENAME == ARGV[1] { onset[++n] = $1; pitch[n] = $3; next }
    { found[++m] = $1; foundPitch[m] = $3 }
    END {
        for (i = 1; i <= n; i++) {
            hit = 0
            for (j = 1; j <= m && !hit; j++) {
                d = foundPitch[j] - pitch[i]; o = found[j] - onset[i]
                if (d <= 0.5 && -d <= 0.5 && o <= 0.05 && -o <= 0.05) hit = 1
            }
            if (!hit) { print "true note at " onset[i] " s (" pitch[i] ") not found"; missed++ }
        }
        if (n != 21) { print n " true notes, expected 21"; missed++ }
        exit missed > 0
    }' "$truth" "$work/notes.csv" || fail "notes against the truth"

# On the notes' steady parts (0.1 s after the onset to 0.05 s before the key release) the pitch
# track lies within 50 cents of the note (the vibrato swings 25 cents) in 97% of the blocks.
awk -F, 'FNR == 1 { next }
    FILENAME == ARGV[1] { on[++n] = $1; off[n] = $2; pitch[n] = $3; next }
    {
        for (i = 1; i <= n; i++) {
            if ($1 <= on[i] + 0.1 || $1 >= off[i] - 0.05) continue
            total++
            if ($2 <= 0) continue
            cents = 1200 * log($2 / (440 * 2 ^ ((pitch[i] - 69) / 12))) / log(2)
            if (cents <= 50 && -cents <= 50) good++
        }
    }
    END { if (total < 500 || good < 0.97 * total) { print good " of " total " steady blocks on pitch"; exit 1 } }' \
    "$truth" "$work/pitch.csv" || fail "pitch track on the steady parts"

# A command line the command does not understand: its usage line and exit code 2, no files.
run analyse "$wave" --pitch-range 7 --notes-csv "$work/bad-range.csv" >/dev/null 2>"$work/err.txt"
status=$?
[ $status -eq 2 ] || fail "a pitch range of 7 exited with $status"
grep -qx "melodrift-cli: analyse: expected IN.wav \[--pitch-range 0|1|2\] \[--enhanced\] \[--boost\] \[--ft-csv FILE\] \[--notes-csv FILE\] \[--pitch-csv FILE\]" \
    "$work/err.txt" || fail "usage text: $(cat "$work/err.txt")"
[ ! -e "$work/bad-range.csv" ] || fail "a refused command line wrote its notes file"

# A file that is no wave: the opening message, exit code 1, no files.
printf 'RIFF\004\000\000\000WAVE' >"$work/broken.wav"
run analyse "$work/broken.wav" --notes-csv "$work/broken.csv" >/dev/null 2>"$work/err.txt"
status=$?
[ $status -eq 1 ] || fail "a broken wave exited with $status"
grep -q "(error): This file cannot be opened. Please check it is not open in another application.$" "$work/err.txt" \
    || fail "a broken wave gave another message: $(cat "$work/err.txt")"
[ ! -e "$work/broken.csv" ] || fail "a broken wave wrote its notes file"

[ $failures -eq 0 ] || exit 1
echo "melodrift-cli analyse: all checks passed"
