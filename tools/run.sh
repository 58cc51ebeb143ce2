#!/usr/bin/env bash
# Installs what Melodrift needs, builds it and runs the main job on FILE, or on the bundled
# demo recording when no file is given: the file is opened as the desktop program opens it
# (analysed chunk by chunk by the opening worker), its notes are printed and saved as a MIDI
# file, and the song as a wave file, in build/run/. Where a display is available the desktop
# program then starts with the same file open. Working files and settings of this run stay in
# the build folder, so it never touches the user's own.
set -euo pipefail
top="$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)"
bash "$top/tools/install-deps.sh"
cmake -S "$top" -B "$top/build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo
cmake --build "$top/build" -j2

file="${1:-$top/build/demo/demo-melody.wav}"
name="$(basename "${file%.*}")"
run="$top/build/run"
mkdir -p "$run"
midi="$run/$name.mid"
wave="$run/$name.wav"
notes="$run/$name.notes.csv"
# Never write the song over the file it is read from.
if [ "$(realpath -m "$file")" = "$(realpath -m "$wave")" ]; then wave="$run/$name.song.wav"; fi
if [ "$(realpath -m "$file")" = "$(realpath -m "$midi")" ]; then midi="$run/$name.song.mid"; fi
# A MIDI file gives notes and no recording: there is no wave to save.
outputs=(--midi "$midi" --notes-csv "$notes")
recording=1
case "${file,,}" in
  *.mid | *.midi) recording=0 ;;
  *) outputs+=(--wave "$wave") ;;
esac

"$top/build/melodrift-cli" --shared "$run" --config "$run/config" open "$file" "${outputs[@]}"

# The demo recording comes with its true notes: say how many of them were found (same
# semitone, onset within 0.15 s). They are the recording's, timed from its lead-in.
truth="$(dirname "$file")/$name.notes.csv"
if [ "$recording" = 1 ] && [ -f "$truth" ] && [ "$(realpath "$truth")" != "$(realpath -m "$notes")" ]; then
  awk -F, 'FNR == 1 { next }
    FILENAME == ARGV[1] { onset[++n] = $1; pitch[n] = $3; next }
    { found[++m] = $1; foundPitch[m] = $3 }
    END {
      hit = 0
      for (i = 1; i <= n; i++)
        for (j = 1; j <= m; j++)
          if (foundPitch[j] == pitch[i] && found[j] - onset[i] <= 0.15 && onset[i] - found[j] <= 0.15) { hit++; break }
      printf "Check against %s: %d of %d true notes found (same semitone, onset within 0.15 s)\n", ARGV[1], hit, n
    }' "$truth" "$notes"
fi

if [ -n "${DISPLAY:-}" ] && [ -x "$top/build/app/melodrift" ]; then
  echo "Starting the desktop program with $file open (close it to end the run)..."
  exec "$top/build/app/melodrift" --shared "$run" --config "$run/config" "$file"
fi
