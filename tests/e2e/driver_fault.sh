#!/usr/bin/env bash
# A driver failure injected into the simulator: the report asks Yes or No. Yes goes on with the
# next step and the panel stays usable (a later Go reads a block); No ends the program at once
# with status 0, before any further driver call.
# shellcheck source=tests/e2e/lib.sh
source "$(dirname "$0")/lib.sh"
e2e_init "${1:-}"

# The range read after the block fails once, with the simulator's "Parameter value out of range".
# Go, then the report: the failed call, the library asked for its text and details, the question
# waiting for an answer.
go_to_report() {
    e2e_start_panel OST7720_SIM_FAIL=ost7720_getRange:-1105:1
    e2e_wait_main
    main_button Go
    e2e_wait_dialog "$MAIN"
    local n
    n=$(grep -nE '^ost7720_getRange\([0-9]+, 1\) -> -1105$' "$TRACE" | tail -n 1 | cut -d: -f1)
    [ -n "$n" ] || e2e_fail "a report without the failed call in the trace"
    e2e_trace_since_has "$((n - 1))" '^ost7720_error_message\([0-9]+, -1105\) -> 0 => "Parameter value out of range"$' ||
        e2e_fail "the report did not ask the library for the error text"
    e2e_trace_since_has "$((n - 1))" '^ost7720_errorDetails\([0-9]+, 100\) -> 0 => "ost7720_getRange: ' ||
        e2e_fail "the report did not ask the library for the error details"
    sleep 0.3
    e2e_panel_alive || e2e_fail "the panel ended before the question was answered"
}

# Yes: the single block ends as usual, the panel lives on, and the next Go reads a block and the
# range without a report.
go_to_report
before=$(e2e_trace_lines)
e2e_key "$DIALOG" y
e2e_wait "$E2E_TIMEOUT" "the message box to close" e2e_one_window "$APP_TITLE"
e2e_wait "$E2E_TIMEOUT" "the run to end after Yes" e2e_trace_since_has "$before" "$E2E_RESET"
e2e_panel_alive || e2e_fail "the panel ended after Yes"
e2e_note "Yes: the report closed and the run ended normally"
before=$(e2e_trace_lines)
n=$(e2e_reads 1)
main_button Go
e2e_wait "$E2E_TIMEOUT" "a block from the next Go" e2e_reads_reach 1 $((n + 1))
e2e_wait "$E2E_TIMEOUT" "the next run to end" e2e_trace_since_has "$before" "$E2E_RESET"
e2e_trace_since_has "$before" '^ost7720_getRange\([0-9]+, 1\) -> 0 => 2$' || e2e_fail "the next Go did not read the range"
e2e_one_window "$APP_TITLE" || e2e_fail "another message box after the next Go"
e2e_note "a later Go read a block without a report"
main_button Exit
e2e_wait_exit

# No: the program ends at once; the details are the last call, not even the session is closed.
go_to_report
e2e_key "$DIALOG" n
e2e_wait_exit
[ "$PANEL_STATUS" -eq 0 ] || e2e_fail "the panel ended with status $PANEL_STATUS after No"
[[ $(tail -n 1 "$TRACE") == ost7720_errorDetails* ]] || e2e_fail "driver calls after No: $(tail -n 1 "$TRACE")"
e2e_note "No ended the panel at once with status 0"
