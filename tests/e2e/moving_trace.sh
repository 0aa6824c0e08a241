#!/usr/bin/env bash
# Go in Repeat draws a moving trace: Repeat chosen on the Measurement page by clicks, Go, then
# two screenshots some blocks apart differ inside the trace area and nowhere else; Stop resets the
# measurement and the blocks stop.
# shellcheck source=tests/e2e/lib.sh
source "$(dirname "$0")/lib.sh"
e2e_init "${1:-}"
e2e_require import compare
e2e_start_panel
e2e_wait_main
e2e_choose_repeat

# Go sets the measurement up and arms it before the poll finds blocks and reads them.
before=$(e2e_trace_lines)
main_button Go
e2e_wait "$E2E_TIMEOUT" "the first block" e2e_reads_reach 1 1
[[ $(e2e_trace_since "$before" | grep -m1 -E '^ost7720_(initMeasure|blockAvailable)') =~ \
    ^ost7720_initMeasure\([0-9]+,\ [0-9]+\)\ -\>\ 0$ ]] || e2e_fail "Go did not arm before blocks were polled"
e2e_trace_has '^ost7720_blockAvailable\([0-9]+, [0-9]+\) -> 0 => 1$' || e2e_fail "no block was reported available"

# Two pictures at least two blocks apart.
e2e_wait "$E2E_TIMEOUT" "a block after Go" e2e_reads_reach 1 $(($(e2e_reads 1) + 1))
e2e_shot "$MAIN" "$E2E_DIR/first.png"
e2e_wait "$E2E_TIMEOUT" "two more blocks" e2e_reads_reach 1 $(($(e2e_reads 1) + 2))
e2e_shot "$MAIN" "$E2E_DIR/second.png"

# Pixels that differ between the pictures inside FX FY FW FH of the window (the whole window
# without), with a pixel of margin for the pictures' edges. The trace area is 70% of the width
# from 10% and 70% of the height from 1%; the Go button, which shows "Reading" while a block is
# read, is looked at apart from the rest.
e2e_geometry "$MAIN"
changed() {
    local crop=""
    [ $# -eq 0 ] || crop=$(awk -v w="$GW" -v h="$GH" -v x="$1" -v y="$2" -v fw="$3" -v fh="$4" 'BEGIN {
        printf "[%dx%d+%d+%d]", w * fw + 2, h * fh + 2, w * x - 1, h * y - 1 }')
    # shellcheck disable=SC2069  # compare writes the count to stderr: keep that, drop stdout
    compare -metric AE "$E2E_DIR/first.png$crop" "$E2E_DIR/second.png$crop" null: 2>&1 >/dev/null || true
}
whole=$(changed) inside=$(changed 0.1 0.01 0.7 0.7) go=$(changed 0 0.855 0.16 0.145)
e2e_note "pixels changed: $whole in the window, $inside in the trace area, $go on Go"
[ "$inside" -gt 500 ] || e2e_fail "the trace did not move between the pictures ($inside pixels changed)"
[ $((whole - inside - go)) -eq 0 ] || e2e_fail "$((whole - inside - go)) pixels changed outside the trace area"

# Stop: the measurement is reset and no block is read after it.
e2e_stop_run
n=$(e2e_reads 1)
sleep 0.5
[ "$(e2e_reads 1)" -eq "$n" ] || e2e_fail "blocks were still read after Stop"
e2e_panel_alive || e2e_fail "the panel ended"
e2e_note "Stop reset the measurement; no block read after it"
