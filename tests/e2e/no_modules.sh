#!/usr/bin/env bash
# A system without modules: discovery finds none, the splash shows the message instead of the
# main window, and OK ends the program with status 0 without another driver call.
# shellcheck source=tests/e2e/lib.sh
source "$(dirname "$0")/lib.sh"
e2e_init "${1:-}"

e2e_start_panel OST7720_SIM_MODULES=
# The splash and the message over it both carry the panel's title; the message is the smaller one.
two_windows() { [ "$(e2e_window_count "$APP_TITLE")" -eq 2 ]; }
e2e_wait "$E2E_TIMEOUT" "the message over the splash" two_windows
box="" box_area=0
for wid in $(e2e_windows "$APP_TITLE"); do
    e2e_geometry "$wid"
    if [ "$box_area" -eq 0 ] || [ $((GW * GH)) -lt "$box_area" ]; then
        box=$wid box_area=$((GW * GH))
    fi
done
e2e_geometry "$box"
if [ "$GW" -ge $((E2E_SCREEN_W / 2)) ] || [ "$GH" -ge $((E2E_SCREEN_H / 4)) ]; then
    e2e_fail "no message box: the smaller window is ${GW}x${GH}"
fi
e2e_note "the message is shown (${GW}x${GH} at $GX,$GY)"

# Discovery asked once, found nothing, and nothing else was called.
[ "$(wc -l <"$TRACE")" -eq 1 ] || e2e_fail "calls besides discovery: $(cat "$TRACE")"
grep -qE '^ost7720_find\(0, 50, 10\) -> 0 => \[0\], 0, "VXI0"$' "$TRACE" ||
    e2e_fail "discovery did not report an empty system: $(cat "$TRACE")"

# The box is modal and waits.
sleep 0.3
e2e_panel_alive || e2e_fail "the panel ended before OK"

e2e_key "$box" Return
e2e_wait_exit
[ "$PANEL_STATUS" -eq 0 ] || e2e_fail "the panel ended with status $PANEL_STATUS after OK"
[ "$(wc -l <"$TRACE")" -eq 1 ] || e2e_fail "driver calls after OK: $(tail -n +2 "$TRACE")"
e2e_note "OK ended the panel with status 0 and no further driver call"
