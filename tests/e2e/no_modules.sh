#!/usr/bin/env bash
# A system without modules: discovery finds none, the splash shows the message instead of the
# main window, and OK ends the program with status 0 without another driver call.
# shellcheck source=tests/e2e/lib.sh
source "$(dirname "$0")/lib.sh"
e2e_init "${1:-}"
e2e_start_panel OST7720_SIM_MODULES=

# The splash and the message over it both carry the panel's title; the message is the one under
# half the screen's width and a quarter of its height.
e2e_wait "$E2E_TIMEOUT" "the message over the splash" e2e_windows_are 2 "$APP_TITLE"
box="" sizes=""
for wid in $(e2e_windows "$APP_TITLE"); do
    e2e_geometry "$wid"
    sizes+=" ${GW}x${GH}"
    if [ "$GW" -lt $((E2E_SCREEN_W / 2)) ] && [ "$GH" -lt $((E2E_SCREEN_H / 4)) ]; then box=$wid size="${GW}x${GH} at $GX,$GY"; fi
done
[ -n "$box" ] || e2e_fail "no message box among the windows of$sizes"

# Discovery asked once, found nothing, and nothing else was called; the box is modal and waits.
[ "$(e2e_trace_lines)" -eq 1 ] && e2e_trace_has '^ost7720_find\(0, 50, 10\) -> 0 => \[0\], 0, "VXI0"$' ||
    e2e_fail "not one discovery call that reported an empty system: $(cat "$TRACE")"
sleep 0.3
e2e_panel_alive || e2e_fail "the panel ended before OK"
e2e_note "the message is shown ($size)"

e2e_key "$box" Return
e2e_wait_exit
[ "$PANEL_STATUS" -eq 0 ] || e2e_fail "the panel ended with status $PANEL_STATUS after OK"
[ "$(e2e_trace_lines)" -eq 1 ] || e2e_fail "driver calls after OK: $(e2e_trace_since 1)"
e2e_note "OK ended the panel with status 0 and no further driver call"
