#!/usr/bin/env bash
# Output files named on the Display page: a single block rewrites the file with one block, Repeat
# appends block after block; every line is one quoted sample in the standard number text ended by
# CR LF, and every block is 1024 samples and the closing element 0.
# shellcheck source=tests/e2e/lib.sh
source "$(dirname "$0")/lib.sh"
e2e_init "${1:-}"

e2e_start_panel
e2e_wait_main

file1="$E2E_DIR/trace1.txt"  # absolute
file2="trace2.txt"           # relative to the panel's folder

main_button Display
e2e_wait_page "Display Controls"
disp_file 0 "$file1"
disp_channel 1 2
disp_file 1 "$file2"
page_ok
e2e_back_to_main "Display Controls"

lines() { if [ -f "$1" ]; then wc -l <"$1"; else echo 0; fi; }
has_lines() { [ "$(lines "$1")" -eq "$2" ]; }
reads() { e2e_trace_count "^ost7720_readFloat64Data\\([0-9]+, $1, .* -> 0 "; }

# One block of the default measurement: 1024 points, so 1025 lines per block.
check_blocks() { # FILE BLOCKS
    local file=$1 blocks=$2 report
    report=$(awk -v blocks="$blocks" '
        function fail(why) { printf "line %d: %s: [%s]\n", NR, why, $0; bad = 1; exit }
        {
            if (substr($0, length($0)) != "\r") fail("not ended by CR LF")
            line = substr($0, 1, length($0) - 1)
            if (line !~ /^"[ -][0-9.E+-]+"$/) fail("not a quoted number")
            text = substr(line, 3, length(line) - 3)
            mant = text; sub(/E.*/, "", mant)
            if (text !~ /^([1-9][0-9]*|0)?(\.[0-9]*[1-9])?(E[+-][0-9]+)?$/ || mant == "")
                fail("not the standard number text")
            if (mant ~ /^0./) fail("a zero before the point")
            digits = mant; gsub(/[^0-9]/, "", digits); sub(/^0+/, "", digits)
            if (length(digits) > 15) fail("more than 15 digits")
            v = (substr(line, 2, 1) == "-" ? -1 : 1) * text
            k = (NR - 1) % 1025
            if (k == 1024) {
                if (line != "\" 0\"") fail("a block does not close with element 0")
                if (crossings < 38 || crossings > 42) fail("block of " (crossings + 0) " zero crossings, not 20 periods")
                if (peak < 0.9 || peak > 1.1) fail("block peak " peak ", not the 1 V sine")
                crossings = 0; peak = 0; prev = 0
                next
            }
            if (v > 2 || v < -2) fail("sample beyond the 2 V range")
            if (v < 0) v2 = -v; else v2 = v
            if (v2 > peak) peak = v2
            if (k > 0 && (v < 0) != (prev < 0)) crossings++
            prev = v
        }
        END {
            if (bad) exit 1
            if (NR != blocks * 1025) { printf "%d lines, not %d blocks of 1025\n", NR, blocks; exit 1 }
        }' "$file") || e2e_fail "$file: $report"
}

# Single block: both files hold the one block; a second run rewrites them.
for run in 1 2; do
    before=$(e2e_trace_lines)
    n1=$(reads 1)
    n2=$(reads 2)
    main_button Go
    e2e_wait "$E2E_TIMEOUT" "the single block to end" \
        e2e_trace_since_has "$before" "$E2E_RESET"
    e2e_wait "$E2E_TIMEOUT" "the files to be written" has_lines "$E2E_DIR/$file2" 1025
    if [ "$(reads 1)" -ne $((n1 + 1)) ] || [ "$(reads 2)" -ne $((n2 + 1)) ]; then
        e2e_fail "a single block did not read channels 1 and 2 once each"
    fi
    check_blocks "$file1" 1
    check_blocks "$E2E_DIR/$file2" 1
    e2e_note "single block $run: both files hold one block of 1025 lines"
done

# Repeat appends: the file ends with as many blocks as were read.
main_button Meas
e2e_wait_page "Measurement Control"
meas_option Repeat
page_ok
e2e_back_to_main "Measurement Control"
n1=$(reads 1)
at_least_reads() { [ "$(reads 1)" -ge "$1" ]; }
main_button Go
e2e_wait "$E2E_TIMEOUT" "three blocks" at_least_reads $((n1 + 3))
e2e_stop_run
blocks=$((1 + $(reads 1) - n1))
check_blocks "$file1" "$blocks"
check_blocks "$E2E_DIR/$file2" "$blocks"
e2e_note "repeat: both files grew to $blocks blocks ($((blocks * 1025)) lines), one per block read"
