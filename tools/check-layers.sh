#!/bin/sh
# Checks the include arrows between the source folders, so that the layering stays as built:
#  - store/, audio/ and analysis/ never include a folder above them (shell/, playback/, app/,
#    cli/). The settings and paths (shell/settings.h, shell/paths.h) build on nothing and are
#    read by every subsystem: they are the one exception.
#  - the core (shell/ store/ audio/ analysis/ notes/ playback/ resources/) never includes the
#    programs (app/, cli/); platform/ includes only platform/.
#  - no include circle between the units of the core: a unit is a .h with its .cpp, and unit A
#    depends on unit B when either file of A includes B.h.
#
#   tools/check-layers.sh [SOURCE_DIR]
#
# Prints each offending include or circle and exits 1; prints nothing and exits 0 when clean.
set -eu

cd "${1:-$(dirname "$0")/..}"
core="shell store audio analysis notes playback resources"
status=0

# "file:included/path.h" for every quoted include of the given folders.
includes() {
    grep -rHo --include='*.h' --include='*.cpp' '^#include "[^"]*"' "$@" | sed 's/#include "\(.*\)"/\1/'
}

upward=$(includes store audio analysis | grep -E ':(shell|playback|app|cli)/' |
    grep -vE ':shell/(settings|paths)\.h$' || true)
programs=$(includes $core | grep -E ':(app|cli)/' || true)
platform=$(includes platform | grep -vE ':platform/' || true)
for found in "$upward" "$programs" "$platform"; do
    [ -z "$found" ] && continue
    echo "$found" | sed 's/:/ includes /; s/^/upward include: /'
    status=1
done

# Unit dependencies as "from to" pairs for tsort, which names the units of any circle.
pairs=$(includes $core | sed 's/\.\(h\|cpp\):/ /; s/\.h$//' | awk '$1 != $2 { print }' | sort -u)
if circle=$(echo "$pairs" | tsort 2>&1 >/dev/null) && [ -z "$circle" ]; then
    :
else
    echo "$circle" | sed 's/^tsort: -: input contains a loop:/include circle:/; s/^tsort: /    /'
    status=1
fi
exit $status
