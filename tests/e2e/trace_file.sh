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

# FILE BLOCKS: the file holds exactly these blocks of the default measurement, each 1024 samples
# of the 1 V sine (20 periods, within the 2 V range) and the closing element 0: 1025 lines a block.
check_blocks() {
    local report
    report=$(awk -v blocks="$2" '
        function fail(why) { printf "line %d: %s: [%s]\n", NR, why, $0; bad = 1; exit }
        !sub(/\r$/, "") { fail("not ended by CR LF") }
        !/^"[ -](0|[1-9][0-9]*(\.[0-9]*[1-9])?|\.[0-9]*[1-9])(E[+-][0-9]+)?"$/ { fail("not the standard number text, quoted") }
        { digits = $0; sub(/E.*/, "", digits); gsub(/[^0-9]/, "", digits); sub(/^0+/, "", digits) }
        length(digits) > 15 { fail("more than 15 digits") }
        { v = substr($0, 3, length($0) - 3) * (substr($0, 2, 1) == "-" ? -1 : 1) }
        (NR - 1) % 1025 == 1024 {
            if ($0 != "\" 0\"") fail("a block does not close with element 0")
            if (crossings < 38 || crossings > 42) fail("block of " (crossings + 0) " zero crossings, not 20 periods")
            if (peak < 0.9 || peak > 1.1) fail("block peak " peak ", not the 1 V sine")
            crossings = peak = 0; next
        }
        v > 2 || v < -2 { fail("sample beyond the 2 V range") }
        v > peak || -v > peak { peak = v < 0 ? -v : v }
        (NR - 1) % 1025 > 0 && (v < 0) != (prev < 0) { crossings++ }
        { prev = v }
        END { if (!bad && NR != blocks * 1025) { printf "%d lines, not %d blocks of 1025\n", NR, blocks; bad = 1 }; exit bad }
    ' "$1") || e2e_fail "$1: $report"
}
has_lines() { [ -f "$1" ] && [ "$(wc -l <"$1")" -eq "$2" ]; }

# Single block: both files hold the one block, read once from each channel; a second run rewrites them.
for run in 1 2; do
    before=$(e2e_trace_lines)
    main_button Go
    e2e_wait "$E2E_TIMEOUT" "the single block to end" e2e_trace_since_has "$before" "$E2E_RESET"
    e2e_wait "$E2E_TIMEOUT" "the files to be written" has_lines "$E2E_DIR/$file2" 1025
    [ "$(e2e_reads 1) $(e2e_reads 2)" = "$run $run" ] || e2e_fail "a single block did not read channels 1 and 2 once each"
    check_blocks "$file1" 1
    check_blocks "$E2E_DIR/$file2" 1
    e2e_note "single block $run: both files hold one block of 1025 lines"
done

# Repeat appends to the block there: the files end with one more block than were read.
e2e_choose_repeat
n=$(e2e_reads 1)
main_button Go
e2e_wait "$E2E_TIMEOUT" "three blocks" e2e_reads_reach 1 $((n + 3))
e2e_stop_run
blocks=$((1 + $(e2e_reads 1) - n))
check_blocks "$file1" "$blocks"
check_blocks "$E2E_DIR/$file2" "$blocks"
e2e_note "repeat: both files grew to $blocks blocks ($((blocks * 1025)) lines), one per block read"
