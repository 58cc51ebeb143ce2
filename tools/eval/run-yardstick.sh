#!/bin/sh
# The development yardstick of recognition: runs melodrift-cli analyse with the default
# settings over every wave file of the generated development corpus and scores the notes and
# the pitch track with the corpus' own scorer. A yardstick for judging changes to the
# analysis and recognition as a whole, not a test: it is not part of the build.
#
#   tools/eval/run-yardstick.sh [EVAL_DEV_DIR] [BUILD_DIR]
#
# EVAL_DEV_DIR is the folder of make_corpus.py and score.py (default: ../shared/eval-dev beside
# the repository); run its setup.sh once beforehand. BUILD_DIR holds melodrift-cli (default:
# build-release in the repository, configured with -DCMAKE_BUILD_TYPE=Release). The corpus is
# generated once into $TMPDIR/melodrift-dev-corpus (MELODRIFT_CORPUS overrides it); results go
# to $TMPDIR/melodrift-yardstick (MELODRIFT_YARDSTICK_OUT overrides it): per file
# <id>.notes.csv and <id>.f0.csv, the scorer's report.md and report.json, and summary.txt with
# the per-file figures.
set -eu

here=$(cd "$(dirname "$0")" && pwd)
repo=$(cd "$here/../.." && pwd)
evaldir=${1:-$repo/../shared/eval-dev}
builddir=${2:-$repo/build-release}
tmp=${TMPDIR:-/tmp}
corpus=${MELODRIFT_CORPUS:-$tmp/melodrift-dev-corpus}
out=${MELODRIFT_YARDSTICK_OUT:-$tmp/melodrift-yardstick}
cli=$builddir/melodrift-cli
python=/usr/bin/python3

[ -f "$evaldir/score.py" ] || { echo "no score.py in $evaldir" >&2; exit 2; }
[ -x "$cli" ] || { echo "no melodrift-cli in $builddir (build it first)" >&2; exit 2; }
evaldir=$(cd "$evaldir" && pwd)

if [ ! -f "$corpus/manifest.json" ]; then
    echo "generating the corpus into $corpus"
    "$python" "$evaldir/make_corpus.py" --out "$corpus" >/dev/null
fi

mkdir -p "$out"
work=$(mktemp -d "$tmp/melodrift-yardstick-work.XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM

# Every item of the manifest: its id and wave file.
"$python" - "$corpus/manifest.json" >"$work/items" <<'PY'
import json, sys
for it in json.load(open(sys.argv[1]))["items"]:
    print(it["id"], it["base"] + ".wav")
PY

while read -r id wav; do
    rm -f "$out/$id.notes.csv" "$out/$id.f0.csv"
    # A private shared folder and configuration: the default settings, whatever the user's are.
    if ! "$cli" --shared "$work/shared" --config "$work/config" analyse "$corpus/$wav" \
            --notes-csv "$out/$id.notes.csv" --pitch-csv "$out/$id.f0.csv" >"$work/$id.log" 2>&1; then
        echo "$id: analyse failed:" >&2
        cat "$work/$id.log" >&2
    fi
done <"$work/items"

"$python" "$evaldir/score.py" batch --corpus "$corpus" --est "$out" --tasks pitch,notes --name melodrift \
    --json "$out/report.json" --md "$out/report.md" >/dev/null

# Per file and overall: note F (onset 50 ms + pitch 50 cents), note F with offsets, raw pitch accuracy.
"$python" - "$out/report.json" <<'PY' | tee "$out/summary.txt"
import json, sys
r = json.load(open(sys.argv[1]))
print("%-28s %8s %8s %8s %9s" % ("file", "F on+p", "F on+p+off", "RPA", "ref/est"))
for fid, f in sorted(r["files"].items()):
    n, p = f["notes"], f["pitch"]
    print("%-28s %8.3f %10.3f %8.3f %4d/%-4d" % (fid, n["onset_pitch"]["f"], n["onset_pitch_offset"]["f"],
                                                p["raw_pitch_accuracy"], n["n_ref"], n["n_est"]))
s = r["summary"]["all"]
print("%-28s %8.3f %10.3f %8.3f %4d/%-4d" % ("overall (mean over files)", s["notes"]["onset_pitch_f"],
                                             s["notes"]["onset_pitch_offset_f"], s["pitch"]["raw_pitch_accuracy"],
                                             s["notes"]["n_ref"], s["notes"]["n_est"]))
PY
