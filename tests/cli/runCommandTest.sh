#!/bin/sh
# melodrift-cli run end to end on the demo recording: a script that cuts a second, pastes it
# back later and undoes both. The saved waves must equal the demo's samples cut and spliced
# as plain byte ranges on whole blocks (512 samples at 44,100 Hz, 16-bit mono, a 44-byte
# header), undo must give back the first wave and notes table byte for byte, redo the cut's,
# and bad scripts are refused before the file is opened.
#
#   runCommandTest.sh MELODRIFT_CLI DEMO_WAVE
set -u
cli=$1
demo=$2
work=$(mktemp -d "${TMPDIR:-/tmp}/melodrift-run-test.XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
failures=0
fail() {
    echo "FAIL: $*" >&2
    failures=$((failures + 1))
}
run() { "$cli" --shared "$work/shared" --config "$work/config" "$@"; }
cd "$work" || exit 1

cat >edit.txt <<'EOF'
# the song as opened
save-wave original.wav
notes-csv original.csv
mode wave
select-time 1 2          # blocks 86 to 172
command cut
save-wave cut.wav
notes-csv cut.csv
paste-at 3               # block 258 of the cut song
save-wave pasted.wav
command undo
command undo
save-wave undone.wav
notes-csv undone.csv
command redo
save-wave redone.wav
notes-csv redone.csv
EOF
run run "$demo" --script edit.txt >out.txt 2>err.txt || fail "the script exited with $?: $(cat err.txt)"

header=44
block=1024   # bytes of one block of samples
# bytes FILE FROM COUNT: COUNT bytes of FILE from byte FROM (0-based); COUNT empty: to the end.
bytes() {
    if [ -n "$3" ]; then tail -c +$(($2 + 1)) "$1" | head -c "$3"; else tail -c +$(($2 + 1)) "$1"; fi
}
samples=$(($(wc -c <original.wav) - header))
cutFrom=$((86 * block))
cutBytes=$(((172 - 86) * block))
{ bytes original.wav $header $cutFrom; bytes original.wav $((header + cutFrom + cutBytes)) ""; } >cut.model
bytes cut.wav $header "" | cmp -s - cut.model || fail "the cut's samples are not the original with blocks 86 to 171 taken out"
[ $(($(wc -c <cut.wav) - header)) -eq $((samples - cutBytes)) ] || fail "the cut's length"
at=$((258 * block))
{ head -c $at cut.model; bytes original.wav $((header + cutFrom)) $cutBytes; tail -c +$((at + 1)) cut.model; } >pasted.model
bytes pasted.wav $header "" | cmp -s - pasted.model || fail "the paste did not put the cut samples back at block 258"

cmp -s original.wav undone.wav || fail "two undos did not give back the original wave"
cmp -s original.csv undone.csv || fail "two undos did not give back the original notes"
cmp -s cut.wav redone.wav || fail "redo did not give back the cut wave"
cmp -s cut.csv redone.csv || fail "redo did not give back the cut's notes"
[ "$(head -n 1 cut.csv)" = "onset_s,offset_s,midi_pitch,pitch_hz,volume_sum" ] || fail "notes header: $(head -n 1 cut.csv)"
# The notes after the cut moved earlier by its block-aligned length, 86 blocks.
awk -F, -v length_s="$(awk 'BEGIN { printf "%.6f", 86 * 512 / 44100 }')" '
    NR == FNR { if (FNR > 1 && $1 > 2.1) before[++n] = $1; next }
    FNR > 1 && $1 > 2.1 - length_s + 0.1 { after[++m] = $1 }
    END {
        if (n == 0 || n != m) { print n " notes after the cut before, " m " after"; exit 1 }
        for (i = 1; i <= n; i++) if (before[i] - after[i] - length_s > 0.0002 || after[i] - before[i] + length_s > 0.0002) {
            print "note " i " at " before[i] " moved to " after[i]; exit 1 }
    }' original.csv cut.csv || fail "the notes after the cut"
perm=$(ls -l cut.wav | cut -c1-10)
[ "$perm" != "-rw-------" ] || fail "an output file is private to its maker: $perm"

# A bad statement is found before the wave is opened; redo with nothing to redo stops the run.
run run "$demo" -e "select-time 1 2; command frobnicate" >/dev/null 2>bad.txt
[ $? -eq 2 ] || fail "an unknown command is a usage error"
grep -q "line 1: no command is named frobnicate" bad.txt || fail "unknown command message: $(cat bad.txt)"
run run "$demo" -e "command redo" >/dev/null 2>redo.txt
[ $? -eq 1 ] || fail "redo with nothing to redo exits with 1"
grep -q "redo is not enabled now (Redo is greyed)" redo.txt || fail "greyed redo message: $(cat redo.txt)"
run run "$demo" -e "save-wave $demo" >/dev/null 2>same.txt
[ $? -eq 1 ] || fail "saving over the file being read must fail"
grep -q "is the file being read" same.txt || fail "saving over the input: $(cat same.txt)"
folder="$work/shared/Torvellan Shared"
# At exit the working files are gone; the undo folder stays, empty.
[ -z "$(cd "$folder" && find . -type f)" ] || fail "working files left at exit: $(cd "$folder" && find . -type f)"

# --keep-working-files leaves the song's working files and the undo folder for inspection.
run --keep-working-files run "$demo" -e "select-time 1 2; mode wave; command cut" 2>keep.txt || fail "keep run: $(cat keep.txt)"
for name in CS.fw CS.ft CS.fi CS.ft+ CS.fi+ CSUndo/Undo0 CSUndo/FrDr0 CSUndo/FrSd0; do
    [ -e "$folder/$name" ] || fail "--keep-working-files did not keep $name"
done

[ $failures -eq 0 ] && echo "run command: all checks passed"
exit $((failures > 0))
