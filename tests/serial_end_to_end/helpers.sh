# Sourced by the run_* scripts of the serial fault matrix: the extension's serial driver (lvrecv)
# receives from the instrument simulator (lvsim) over virtual COM pairs, with faults.
# Usage, in a script: . helpers.sh BUILD_DIR PROCEDURE   (PROCEDURE: line, raw, bcc or ymodem)
# shellcheck shell=bash
set -uo pipefail
build=$(cd "${1:?build directory}" && pwd)
procedure=${2:?procedure}
root=$(cd "$(dirname "${BASH_SOURCE[0]}")/../.." && pwd)
. "$root/scripts/wine-env" "$build"
lv_wine_prefix_ready || exit 1
bin="$build/bin"
sample="$root/tools/lvsim/samples/survey.lv"
work="$build/serial_end_to_end/$procedure"
rm -rf "$work"
mkdir -p "$work"
passed=0
failed=0
# The procedure's own cables, so that the four procedures can run side by side: COM quick and
# quick+1 for the quick cases, the next two pairs for the one-minute cases that run beside them.
# The cables fixture lays out all four sets.
case $procedure in
line) quick=60 ;;
raw) quick=66 ;;
bcc) quick=72 ;;
ymodem) quick=78 ;;
*) echo "helpers.sh: unknown procedure $procedure" >&2; exit 2 ;;
esac
beside=$((quick + 2))
beside2=$((quick + 4))

# The driver's messages as lvrecv prints them: "[code N] text".
wait_expired="[code 4] The waiting time of the data has expired."
interrupted="[code 4] The communication's process is interrupted by the user"
block_failed="[code 4] AZ doesn't respond or error in importing block"
# The virtual cable has no speed of its own: faults that do not depend on timing run fast.
baud=115200
# A receive still running after this many seconds hangs (the driver's longest wait is a minute).
hang_limit=150

check() {  # check "what" command...
    local what=$1
    shift
    if "$@"; then
        echo "ok: $procedure $what"
        passed=$((passed + 1))
    else
        echo "FAILED: $procedure $what"
        failed=$((failed + 1))
    fi
}
finish() {
    echo "checks: $passed passed, $failed failed"
    [ "$failed" -eq 0 ]
}

wait_for() {  # wait_for FILE TEXT: true once FILE holds TEXT, false after 30 s without it
    local _
    for _ in $(seq 300); do
        grep -qF -- "$2" "$1" 2>/dev/null && return 0
        sleep 0.1
    done
    return 1
}

# start_simulator BASE COM OPTIONS: lvsim on COM with the sample file and this procedure, its
# output in BASE.sim; sets simulator_pid.
start_simulator() {
    # shellcheck disable=SC2086 # the options are words
    wine "$bin/lvsim.exe" --port "COM$2" --baud "$baud" --protocol "$procedure" \
        --file "Z:$sample" --verbose $3 >"$1.sim" 2>&1 &
    simulator_pid=$!
}
# start_receiver BASE COM OPTIONS: lvrecv on COM, timed; sets receiver_pid. Leaves BASE.out (the
# received file), BASE.log (its output), BASE.code (its exit code) and BASE.time (elapsed, user
# and system seconds).
start_receiver() {
    (
        TIMEFORMAT='%R %U %S'
        # shellcheck disable=SC2086
        { time timeout "$hang_limit" wine "$bin/lvrecv.exe" --port "COM$2" --baud "$baud" \
            --protocol "$procedure" --out "Z:$1.out" $3 >"$1.log" 2>&1; } 2>"$1.time"
        echo $? >"$1.code"
    ) &
    receiver_pid=$!
}

# receive CASE COM SIMULATOR_OPTIONS RECEIVER_OPTIONS [PULL_AFTER]
# One receive on a fresh cable, so that nothing an earlier case left on the line reaches it:
# lvrecv on COMn, lvsim on COMn+1. SIMULATOR_OPTIONS "-": no instrument at all (silence).
# PULL_AFTER: a text of lvsim's log after which the cable itself is pulled (the socat pair
# stopped). The files of the case are $work/CASE.*.
receive() {
    local case=$1 com=$2 simulator=$3 receiver=$4 pull_after=${5:-}
    local base="$work/$case" cable_puller=""
    simulator_pid=""
    "$root/scripts/com-pair" up "$build" "$com" $((com + 1)) || return 1
    : >"$base.log"
    : >"$base.sim"
    # Whoever speaks first must find the other listening: the receiver (ENQ, "C") in the block
    # protocols, the instrument in the line protocol and the raw stream.
    if [ "$simulator" = - ]; then
        start_receiver "$base" "$com" "$receiver"
    elif [ "$procedure" = bcc ] || [ "$procedure" = ymodem ]; then
        start_simulator "$base" $((com + 1)) "$simulator"
        wait_for "$base.sim" "lvsim: ready"
        start_receiver "$base" "$com" "$receiver"
    else
        start_receiver "$base" "$com" "$receiver"
        wait_for "$base.log" "progress 0 / 100"
        start_simulator "$base" $((com + 1)) "$simulator"
    fi
    if [ -n "$pull_after" ]; then
        (wait_for "$base.sim" "$pull_after" &&
            "$root/scripts/com-pair" down "$build" "$com" $((com + 1))) &
        cable_puller=$!
    fi
    wait "$receiver_pid"
    if [ -n "$simulator_pid" ]; then
        local _
        for _ in $(seq 300); do kill -0 "$simulator_pid" 2>/dev/null || break; sleep 0.1; done
        kill "$simulator_pid" 2>/dev/null  # still running after 30 s: its log shows where
        wait "$simulator_pid"
    fi
    [ -z "$cable_puller" ] || wait "$cable_puller"
    "$root/scripts/com-pair" down "$build" "$com" $((com + 1))
}

# What lvrecv printed of the driver's messages, one a line.
driver_messages() {
    tr -d '\r' <"$work/$1.log" | sed -n 's/^lvrecv: \(\[code [0-9]*\] .*\)$/\1/p'
}
# A one-line account of a case for the reader of the output.
report() {
    local real user system
    read -r real user system <"$work/$1.time"
    echo "-- $procedure $1: exit $(cat "$work/$1.code"), $real s," \
        "CPU $(awk "BEGIN { print $user + $system }") s"
    driver_messages "$1" | sed 's/^/   /'
}

# The checks a case can make.
exit_code_is() { [ "$(cat "$work/$1.code")" = "$2" ]; }
messages_are() {  # messages_are CASE [MESSAGE...]: exactly these driver messages, in this order
    local case=$1 expected=""
    shift
    [ $# -gt 0 ] && expected=$(printf '%s\n' "$@")
    [ "$(driver_messages "$case")" = "$expected" ]
}
file_equals() { cmp -s "$work/$1.out" "$2"; }
file_is_empty() { [ -f "$work/$1.out" ] && [ ! -s "$work/$1.out" ]; }
# The received file is EXPECTED cut after a whole number of units, at least MIN of them.
file_holds_whole_units() {  # CASE EXPECTED UNIT_BYTES MIN
    local size
    size=$(stat -c %s "$work/$1.out") || return 1
    [ $((size % $3)) -eq 0 ] && [ "$size" -ge $(($3 * $4)) ] &&
        cmp -s "$work/$1.out" <(head -c "$size" "$2")
}
# Less than a second (start-up) plus a tenth of a core over the run. Start-up and a one-minute wait
# on the port cost about 0.1 s. A loop that spins on a dead port instead of waiting shows as half
# a core or more (the rest goes to wineserver). Wine itself busy-polls a pty whose far end hung up,
# but only within each read's time-out (236 ms at most, a few reads before the block procedures
# give up), which stays below the bound.
cpu_is_small() {
    local real user system
    read -r real user system <"$work/$1.time"
    awk "BEGIN { exit !($user + $system < 1 + $real / 10) }"
}
waited_a_minute() {  # the driver gives up after more than 60 s without progress, not before
    local real user system
    read -r real user system <"$work/$1.time"
    awk "BEGIN { exit !($real >= 60) }"
}
simulator_says() {  # simulator_says CASE COUNT PATTERN: lvsim's log matches on COUNT lines
    [ "$(grep -cE -- "$3" "$work/$1.sim")" -eq "$2" ]
}
simulator_succeeded() { grep -qF "lvsim: transfer acknowledged" "$work/$1.sim"; }

# Expected contents, written to $work/expected-NAME.
sample_lines() {  # the first N lines of the sample, each with its CR LF
    head -n "$1" "$sample" >"$work/expected-lines-$1"
    echo "$work/expected-lines-$1"
}
# The data part of the BCC blocks of the first N data lines: each line without its check
# character and comma, filled with spaces to 128 bytes.
bcc_blocks() {
    local line
    sed '1d;$d' "$sample" | tr -d '\r' | head -n "$1" | while IFS= read -r line; do
        printf '%-128s' "${line%??}"
    done >"$work/expected-blocks-$1"
    echo "$work/expected-blocks-$1"
}
# The file that Y-Modem carries: the data lines, with check characters and CR LF.
ymodem_file() { sed '1d;$d' "$sample" >"$work/expected-ymodem"; echo "$work/expected-ymodem"; }
