#!/usr/bin/env bash
# Start-up, the pages and Exit, as a user sees them: the main window centred at two thirds of the
# screen, each page taking exactly its place and giving it back, and Exit ending the program.
# shellcheck source=tests/e2e/lib.sh
source "$(dirname "$0")/lib.sh"
e2e_init "${1:-}"

e2e_start_panel
e2e_wait_main

# Two thirds of the screen, centred: 1280 x 1024 gives 853 x 683 at (213, 171), within a pixel
# for the rounding of twips to pixels.
e2e_geometry "$MAIN"
expect_near() {
    local what=$1 got=$2 want=$3
    awk -v g="$got" -v w="$want" 'BEGIN { d = g - w; exit !(d <= 1 && d >= -1) }' ||
        e2e_fail "$what is $got, expected $want (within a pixel)"
}
expect_near "main window left" "$GX" "$(awk -v s="$E2E_SCREEN_W" 'BEGIN { print s / 6 }')"
expect_near "main window top" "$GY" "$(awk -v s="$E2E_SCREEN_H" 'BEGIN { print s / 6 }')"
expect_near "main window width" "$GW" "$(awk -v s="$E2E_SCREEN_W" 'BEGIN { print s * 2 / 3 }')"
expect_near "main window height" "$GH" "$(awk -v s="$E2E_SCREEN_H" 'BEGIN { print s * 2 / 3 }')"
main_geometry="$GX $GY $GW $GH"
e2e_note "main window at $main_geometry"

# Start-up: discovery of the two default modules, each probed in a session of its own, then one
# session over both and its four channel groups.
[ "$(e2e_trace_count '^ost7720_find\(.*-> 0 => \[2\], 2, "VXI0"$')" -eq 1 ] ||
    e2e_fail "discovery did not find the two modules: $(grep -m1 '^ost7720_find' "$TRACE")"
e2e_trace_has '^ost7720_init\("VXI0::(16,8|8,16)::INSTR", 1, 1\) -> 0' ||
    e2e_fail "no session over both modules: $(grep '^ost7720_init(' "$TRACE")"
[ "$(e2e_trace_count '^ost7720_createChannelGroup\(.* -> 0 ')" -eq 4 ] || e2e_fail "not four channel groups"

# Every page takes the main window's place and size and hands them back.
visit() {
    local button=$1 title=$2 leave=$3
    local before
    main_button "$button"
    e2e_wait_page "$title"
    e2e_geometry "$PAGE"
    [ "$GX $GY $GW $GH" = "$main_geometry" ] ||
        e2e_fail "\"$title\" is at $GX $GY $GW $GH, not in the main window's place $main_geometry"
    before=$(e2e_trace_lines)
    "$leave"
    e2e_back_to_main "$title"
    e2e_geometry "$MAIN"
    [ "$GX $GY $GW $GH" = "$main_geometry" ] || e2e_fail "the main window came back at $GX $GY $GW $GH"
    LEFT_CALLS=$(e2e_trace_since "$before")
    e2e_note "$button: \"$title\" took the main window's place and gave it back"
}
visit Meas "Measurement Control" page_cancel
visit Display "Display Controls" page_cancel
visit Input "Input Setup" page_cancel
visit Source "Source Setup" page_cancel

# The VXI page has no Cancel; its OK opens the session again over the modules in use.
visit VXI "VXI setup" page_ok
grep -qE '^ost7720_close\(3\) -> 0' <<<"$LEFT_CALLS" || e2e_fail "VXI OK did not close the old session"
grep -qE '^ost7720_init\(.* -> 0 => [0-9]+$' <<<"$LEFT_CALLS" || e2e_fail "VXI OK did not open a session"

# Exit closes the session and ends the program with status 0; nothing is called after the close.
main_button Exit
e2e_wait_exit
[ "$PANEL_STATUS" -eq 0 ] || e2e_fail "the panel ended with status $PANEL_STATUS after Exit"
[[ $(tail -n 1 "$TRACE") =~ ^ost7720_close\([0-9]+\)\ -\>\ 0$ ]] ||
    e2e_fail "the last call after Exit is not the session's close: $(tail -n 1 "$TRACE")"
e2e_note "Exit ended the panel with status 0 after closing the session"
