# Sourced by the command-line tests: a working folder of the test's own (removed at its end),
# where the program keeps its working files and settings, and a failure count.
#
#   cli=... ; . cliTestSupport.sh NAME
work=$(mktemp -d "${TMPDIR:-/tmp}/$1.XXXXXX")
trap 'rm -rf "$work"' EXIT INT TERM
failures=0
fail() {
    echo "FAIL: $*" >&2
    failures=$((failures + 1))
}
run() { "$cli" --shared "$work" --config "$work/config" "$@"; }
