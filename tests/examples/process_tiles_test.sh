#!/usr/bin/env bash
# process_tiles_test.sh PROGRAM DATA SCRATCH: runs the tile example with good and with bad command lines.
set -u
program=$1 data=$2 scratch=$3
failures=0
rm -rf "$scratch"
mkdir -p "$scratch"

fail() {
    echo "FAILED: $*"
    failures=$((failures + 1))
}

nothing_left() {
    [ ! -e "$scratch/out.tif" ] || fail "an output file is there: $*"
    [ -z "$(find "$scratch" -name '.*')" ] || fail "a temporary file is left: $*"
}

# refused STATUS PATTERN ARGUMENT...: ends with STATUS, one line on standard error that has PATTERN, no output file.
refused() {
    local status=$1 pattern=$2
    shift 2
    rm -f "$scratch/out.tif"
    "$program" "$@" > "$scratch/stdout" 2> "$scratch/stderr"
    local got=$?
    [ $got -eq "$status" ] || fail "status $got, not $status: $*"
    [ "$(wc -l < "$scratch/stderr")" -eq 1 ] || fail "not one line: $(cat "$scratch/stderr")"
    grep -qF -- "$pattern" "$scratch/stderr" || fail "no \"$pattern\" in: $(cat "$scratch/stderr")"
    nothing_left "$*"
}

# accepted ARGUMENT...: ends well, silently.
accepted() {
    "$program" "$@" > "$scratch/stdout" 2> "$scratch/stderr" || fail "refused: $* ($(cat "$scratch/stderr"))"
    [ ! -s "$scratch/stderr" ] || fail "standard error: $(cat "$scratch/stderr")"
}

photograph="$data/astronaut.png"
bilateral=(--filter FastBilateralBlur --set spatialSigma=4,4 --set colorize=true)

accepted "${bilateral[@]}" "$photograph" "$scratch/reference.tif"
for variation in "--threads 1" "--tile 128 --threads 3"; do
    # shellcheck disable=SC2086
    accepted "${bilateral[@]}" $variation "$photograph" "$scratch/other.tif"
    [ -s "$scratch/other.tif" ] || fail "no picture with $variation"
done
accepted "${bilateral[@]}" --tile 128 "$photograph" "$scratch/out.exr"
accepted "${bilateral[@]}" --tile 128 "$scratch/out.exr" "$scratch/again.TIFF"
accepted --filter premultiply --target gl --tile 200 "$photograph" "$scratch/gl.tif"
accepted --help
grep -q '^Usage: process_tiles' "$scratch/stdout" || fail "no usage in --help"

output="$scratch/out.tif"
refused 2 'There is no filter "Nonsense"' --filter Nonsense "$photograph" "$output"
refused 2 'has no parameter "sigma"' --filter FastBilateralBlur --set sigma=1 "$photograph" "$output"
refused 2 'is of type float2, which "10" is not' --filter FastBilateralBlur --set spatialSigma=10 "$photograph" "$output"
refused 2 'The filter "premultiply" does not run on cpu' --filter premultiply "$photograph" "$output"
refused 2 'The filter "SimpleBilateralCPU" does not run on gl' --filter SimpleBilateralCPU --target gl "$photograph" "$output"
refused 2 'The memory does not suffice: --memory-limit has to be' "${bilateral[@]}" --memory-limit 1 "$photograph" "$output"
refused 1 'no such file' "${bilateral[@]}" "$scratch/none.png" "$output"
refused 1 'Cannot read' "${bilateral[@]}" "$0" "$output"
refused 1 'no such folder' "${bilateral[@]}" "$photograph" "$scratch/none/out.tif"
refused 1 'tiles go into TIFF and EXR files' "${bilateral[@]}" "$photograph" "$scratch/out.png"
refused 1 'Cannot write' "${bilateral[@]}" "$photograph" "$scratch/out.nonsense"

# A file that ends too early.
head -c 300000 "$scratch/reference.tif" > "$scratch/short.tif"
refused 1 "Cannot read $scratch/short.tif" "${bilateral[@]}" "$scratch/short.tif" "$output"

# No room: files may not grow beyond 64 KiB.
rm -f "$output"
(trap '' XFSZ; ulimit -f 64; exec "$program" "${bilateral[@]}" "$photograph" "$output") > "$scratch/stdout" 2> "$scratch/stderr"
[ $? -eq 1 ] || fail "status without room"
[ "$(wc -l < "$scratch/stderr")" -eq 1 ] || fail "not one line without room: $(cat "$scratch/stderr")"
grep -qF "Cannot write $output" "$scratch/stderr" || fail "without room: $(cat "$scratch/stderr")"
nothing_left "without room"

# An interrupt: no output and status 130. A thousand tiles, and for each the whole photograph has to be computed: what
# is sent is there long before the end.
for signal in INT TERM; do
    rm -f "$output"
    # An interactive program: in the background of a script the interrupt would be ignored.
    python3 - "$signal" "$program" "${bilateral[@]}" --set spatialSigma=100,100 --tile 16 "$photograph" "$output" 2> "$scratch/stderr" << 'PYTHON'
import os, signal, subprocess, sys, time
signal.signal(signal.SIGINT, signal.SIG_DFL)
program = subprocess.Popen(sys.argv[2:], stderr=sys.stderr)
number = getattr(signal, "SIG" + sys.argv[1])
def caught():
    with open(f"/proc/{program.pid}/status") as status:
        return any(line.startswith("SigCgt:") and int(line.split()[1], 16) >> (number - 1) & 1 for line in status)
while program.poll() is None and not caught():
    time.sleep(0.001)
program.send_signal(number)
sys.exit(program.wait() & 255)
PYTHON
    [ $? -eq 130 ] || fail "status of a run interrupted by $signal"
    grep -q 'cancelled, nothing was written' "$scratch/stderr" || fail "interrupt: $(cat "$scratch/stderr")"
    nothing_left "$signal"
done

[ $failures -eq 0 ] && echo "all passed"
exit $failures
