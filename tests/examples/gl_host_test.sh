#!/usr/bin/env bash
# gl_host_test.sh PROGRAM CHECK SOURCE SCRATCH: the window host's screenshot, on a display without a screen.
set -u
program=$1 check=$2 source=$3 scratch=$4
photograph="$source/examples/data/astronaut.png"
output="$scratch/refused.png"
source "$source/tests/examples/support/program_test.sh"

"$source/scripts/with-display" "$program" "$photograph" --screenshot "$scratch/gl_host.png" 2> "$scratch/stderr" ||
    fail "status $?: $(cat "$scratch/stderr")"
[ ! -s "$scratch/stderr" ] || fail "standard error: $(cat "$scratch/stderr")"
"$check" "$photograph" "$scratch/gl_host.png" || fail "the screenshot is another picture"

refused_command 1 "There is no display" env -u DISPLAY -u WAYLAND_DISPLAY "$program" "$photograph" --screenshot "$output"
refused 1 "no such file" "$scratch/none.png" --screenshot "$output"
refused 1 "Usage: gl_host PICTURE" "$photograph" --screenshot

finish
