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
main_geometry="$GX $GY $GW $GH"
for check in "left $GX $E2E_SCREEN_W/6" "top $GY $E2E_SCREEN_H/6" "width $GW $E2E_SCREEN_W*2/3" \
    "height $GH $E2E_SCREEN_H*2/3"; do
    read -r what got want <<<"$check"
    awk "BEGIN { d = $got - $want; exit !(d <= 1 && d >= -1) }" ||
        e2e_fail "main window $what is $got, expected $want (within a pixel)"
done
e2e_note "main window at $main_geometry"

# Start-up: discovery of the two default modules, each probed in a session of its own, then one
# session over both and its four channel groups.
[ "$(e2e_trace_count '^ost7720_find\(.*-> 0 => \[2\], 2, "VXI0"$')" -eq 1 ] ||
    e2e_fail "discovery did not find the two modules: $(grep -m1 '^ost7720_find' "$TRACE")"
e2e_trace_has '^ost7720_init\("VXI0::(16,8|8,16)::INSTR", 1, 1\) -> 0' ||
    e2e_fail "no session over both modules: $(grep '^ost7720_init(' "$TRACE")"
[ "$(e2e_trace_count '^ost7720_createChannelGroup\(.* -> 0 ')" -eq 4 ] || e2e_fail "not four channel groups"

# Every page takes the main window's place and size and hands them back; the VXI page has no
# Cancel, and its OK opens the session again over the modules in use.
for visit in "Meas|Measurement Control|page_cancel" "Display|Display Controls|page_cancel" \
    "Input|Input Setup|page_cancel" "Source|Source Setup|page_cancel" "VXI|VXI setup|page_ok"; do
    IFS='|' read -r button title leave <<<"$visit"
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
    e2e_note "$button: \"$title\" took the main window's place and gave it back"
done
e2e_trace_since_has "$before" '^ost7720_close\(3\) -> 0' || e2e_fail "VXI OK did not close the old session"
e2e_trace_since_has "$before" '^ost7720_init\(.* -> 0 => [0-9]+$' || e2e_fail "VXI OK did not open a session"

# Exit closes the session and ends the program with status 0; nothing is called after the close.
main_button Exit
e2e_wait_exit
[ "$PANEL_STATUS" -eq 0 ] || e2e_fail "the panel ended with status $PANEL_STATUS after Exit"
[[ $(tail -n 1 "$TRACE") =~ ^ost7720_close\([0-9]+\)\ -\>\ 0$ ]] ||
    e2e_fail "the last call after Exit is not the session's close: $(tail -n 1 "$TRACE")"
e2e_note "Exit ended the panel with status 0 after closing the session"
