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

main_button Meas
e2e_wait_page "Measurement Control"
meas_option Repeat
page_ok
e2e_back_to_main "Measurement Control"

reads() { e2e_trace_count '^ost7720_readFloat64Data\([0-9]+, 1, .* -> 0 '; }
reads_above() { [ "$(reads)" -gt "$1" ]; }

before=$(e2e_trace_lines)
main_button Go
e2e_wait "$E2E_TIMEOUT" "the first block" reads_above 0
# Go sets the measurement up and arms it; the poll then finds blocks and reads them.
e2e_trace_since_has "$before" '^ost7720_initMeasure\([0-9]+, [0-9]+\) -> 0$' || e2e_fail "Go did not arm"
first_call=$(grep -m1 -E '^ost7720_(initMeasure|blockAvailable)' < <(e2e_trace_since "$before"))
[[ $first_call == ost7720_initMeasure* ]] ||
    e2e_fail "blocks were polled before the measurement was armed"
e2e_trace_has '^ost7720_blockAvailable\([0-9]+, [0-9]+\) -> 0 => 1$' || e2e_fail "no block was reported available"

# Two pictures at least two blocks apart.
n=$(reads)
e2e_wait "$E2E_TIMEOUT" "a block after Go" reads_above "$n"
e2e_shot "$MAIN" "$E2E_DIR/first.png"
n=$(reads)
e2e_wait "$E2E_TIMEOUT" "two more blocks" reads_above $((n + 1))
e2e_shot "$MAIN" "$E2E_DIR/second.png"

# The trace area is 70% of the window's width from 10% and 70% of its height from 1%; a pixel
# of margin takes in the pictures' edges. The Go button shows "Reading" while a block is read,
# so it is looked at apart from the rest.
e2e_geometry "$MAIN"
region() { # FX FY FW FH -> WxH+X+Y
    awk -v w="$GW" -v h="$GH" -v x="$1" -v y="$2" -v fw="$3" -v fh="$4" 'BEGIN {
        printf "%dx%d+%d+%d", w * fw + 2, h * fh + 2, w * x - 1, h * y - 1 }'
}
changed() { # REGION: pixels that differ between the two pictures (the whole window when empty)
    local crop=${1:+[$1]}
    # shellcheck disable=SC2069  # compare writes the count to stderr: keep that, drop stdout
    compare -metric AE "$E2E_DIR/first.png$crop" "$E2E_DIR/second.png$crop" null: 2>&1 >/dev/null || true
}
trace_area=$(region 0.1 0.01 0.7 0.7)
go_button=$(region 0 0.855 0.16 0.145)
whole=$(changed "")
inside=$(changed "$trace_area")
go=$(changed "$go_button")
e2e_note "pixels changed: $whole in the window, $inside in the trace area $trace_area, $go on Go"
[ "$inside" -gt 500 ] || e2e_fail "the trace did not move between the pictures ($inside pixels changed)"
[ $((whole - inside - go)) -eq 0 ] || e2e_fail "$((whole - inside - go)) pixels changed outside the trace area"

# Stop: the measurement is reset and no block is read after it.
e2e_stop_run
n=$(reads)
sleep 0.5
[ "$(reads)" -eq "$n" ] || e2e_fail "blocks were still read after Stop"
e2e_panel_alive || e2e_fail "the panel ended"
e2e_note "Stop reset the measurement; no block read after it"
