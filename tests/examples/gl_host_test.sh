#!/usr/bin/env bash
# gl_host_test.sh PROGRAM CHECK SOURCE SCRATCH: the window host's screenshot, on a display without a screen.
set -u
program=$1 check=$2 source=$3 scratch=$4
photograph="$source/examples/data/astronaut.png"
failures=0
rm -rf "$scratch"
mkdir -p "$scratch"

fail() {
    echo "FAILED: $*"
    failures=$((failures + 1))
}

# refused PATTERN ARGUMENT...: ends with status 1, one line on standard error that has PATTERN, no picture.
refused() {
    local pattern=$1
    shift
    "$@" > "$scratch/stdout" 2> "$scratch/stderr"
    [ $? -eq 1 ] || fail "status $? of: $*"
    [ "$(wc -l < "$scratch/stderr")" -eq 1 ] || fail "not one line: $(cat "$scratch/stderr")"
    grep -qF -- "$pattern" "$scratch/stderr" || fail "no \"$pattern\" in: $(cat "$scratch/stderr")"
    [ ! -e "$scratch/refused.png" ] || fail "a picture is there: $*"
}

"$source/scripts/with-display" "$program" "$photograph" --screenshot "$scratch/gl_host.png" 2> "$scratch/stderr" ||
    fail "status $?: $(cat "$scratch/stderr")"
[ ! -s "$scratch/stderr" ] || fail "standard error: $(cat "$scratch/stderr")"
"$check" "$photograph" "$scratch/gl_host.png" || fail "the screenshot is another picture"

refused "There is no display" env -u DISPLAY -u WAYLAND_DISPLAY "$program" "$photograph" --screenshot "$scratch/refused.png"
refused "no such file" "$program" "$scratch/none.png" --screenshot "$scratch/refused.png"
refused "Usage: gl_host PICTURE" "$program" "$photograph" --screenshot

[ $failures -eq 0 ] && echo "all passed"
exit $failures
