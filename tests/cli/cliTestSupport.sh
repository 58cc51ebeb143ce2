# Sourced by the command-line tests: a working folder of the test's own (removed at its end),
# where the program keeps its working files and settings, and a failure count.
#
#   cli=... ; test_name=NAME ; . cliTestSupport.sh
# (a sourced file sees the caller's arguments in sh, not its own, so the name comes in a variable)
work=$(mktemp -d "${TMPDIR:-/tmp}/${test_name:?}.XXXXXX") || exit 1
[ -d "$work" ] || exit 1
trap 'rm -rf "$work"' EXIT INT TERM
failures=0
fail() {
    echo "FAIL: $*" >&2
    failures=$((failures + 1))
}
run() { "$cli" --shared "$work" --config "$work/config" "$@"; }
