# What the tests of programs have in common. To be sourced with these set:
#   program   the program that is tested
#   scratch   a folder, which is emptied
#   output    the file that the program is to write; nothing may be there after a failure
failures=0
rm -rf "$scratch"
mkdir -p "$scratch"

fail() {
    echo "FAILED: $*"
    failures=$((failures + 1))
}

# nothing_left WHAT...: neither an output nor a temporary file.
nothing_left() {
    [ ! -e "$output" ] || fail "an output file is there: $*"
    [ -z "$(find "$scratch" -name '.*')" ] || fail "a temporary file is left: $*"
}

# refused_command STATUS PATTERN COMMAND...: ends with STATUS, one line on standard error that has PATTERN, no output.
refused_command() {
    local status=$1 pattern=$2
    shift 2
    rm -f "$output"
    "$@" > "$scratch/stdout" 2> "$scratch/stderr"
    local got=$?
    [ $got -eq "$status" ] || fail "status $got, not $status: $*"
    [ "$(wc -l < "$scratch/stderr")" -eq 1 ] || fail "not one line: $(cat "$scratch/stderr")"
    grep -qF -- "$pattern" "$scratch/stderr" || fail "no \"$pattern\" in: $(cat "$scratch/stderr")"
    nothing_left "$*"
}

# refused STATUS PATTERN ARGUMENT...: the same of the program.
refused() {
    local status=$1 pattern=$2
    shift 2
    refused_command "$status" "$pattern" "$program" "$@"
}

# accepted ARGUMENT...: ends well, silently.
accepted() {
    "$program" "$@" > "$scratch/stdout" 2> "$scratch/stderr" || fail "refused: $* ($(cat "$scratch/stderr"))"
    [ ! -s "$scratch/stderr" ] || fail "standard error: $(cat "$scratch/stderr")"
}

# interrupted SIGNAL ARGUMENT...: sent the signal as soon as it catches it, the program says so, ends with status 130 and
# leaves nothing. The arguments have to ask for work that takes long.
interrupted() {
    local signal=$1
    shift
    rm -f "$output"
    # An interactive program: in the background of a script the interrupt would be ignored.
    python3 - "$signal" "$program" "$@" > "$scratch/stdout" 2> "$scratch/stderr" << 'PYTHON'
import os, signal, subprocess, sys, time
number = getattr(signal, "SIG" + sys.argv[1])
signal.signal(number, signal.SIG_DFL)
program = subprocess.Popen(sys.argv[2:])
def caught():
    with open(f"/proc/{program.pid}/status") as status:
        return any(line.startswith("SigCgt:") and int(line.split()[1], 16) >> (number - 1) & 1 for line in status)
while program.poll() is None and not caught():
    time.sleep(0.001)
program.send_signal(number)
sys.exit(program.wait() & 255)
PYTHON
    local got=$?
    [ $got -eq 130 ] || fail "status $got of a run interrupted by $signal"
    grep -q 'cancelled, nothing was written' "$scratch/stderr" || fail "interrupt: $(cat "$scratch/stderr")"
    nothing_left "$signal"
}

# The end of a test.
finish() {
    [ $failures -eq 0 ] && echo "all passed"
    exit $failures
}
