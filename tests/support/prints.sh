#!/bin/sh
# prints.sh STATUS WORDS COMMAND...
#
# Runs the command and shows what it prints. The result is 0 if it ended with that status and a line has these words.
set -u
status="$1" words="$2"
shift 2
printed="$(mktemp)"
trap 'rm -f "$printed"' EXIT
"$@" >"$printed" 2>&1
ended="$?"
cat "$printed"
if [ "$ended" -ne "$status" ]; then
    echo "prints.sh: it ended with $ended, not with $status" >&2
    exit 1
fi
grep -qF -e "$words" "$printed" || {
    echo "prints.sh: no line has \"$words\"" >&2
    exit 1
}
