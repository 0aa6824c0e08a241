# shellcheck shell=bash disable=SC2034  # sets variables for the scripts that source it
# Helpers of the end-to-end runs: an X server of the run's own, the panel under it, clicks at places
# relative to a window, screenshots and the simulator's call trace. A script calls e2e_init with the
# panel's path first; everything it starts is ended on exit. Places in a window are fractions of its
# size (awk expressions) plus pixels, as the panel's layout computes them, so they hold on any screen.
set -euo pipefail

E2E_SCREEN_W=${E2E_SCREEN_W:-1280}
E2E_SCREEN_H=${E2E_SCREEN_H:-1024}
E2E_TIMEOUT=${E2E_TIMEOUT:-30}  # seconds any one wait may take; generous for a loaded machine
APP_TITLE="Ostrana K7720A Soft Front Panel"
E2E_DIR="" E2E_KEEP=0 XVFB_PID="" PANEL_PID=""
exec 9>&2  # failures are told even from inside a wait that silences its command

e2e_skip() { echo "SKIP: $*"; exit 77; }
e2e_fail() { echo "FAIL: $*" >&9; E2E_KEEP=1; exit 1; }
e2e_note() { echo "-- $*"; }
e2e_not() { ! "$@"; }
e2e_int() { awk "BEGIN { printf \"%d\", $1 }"; }  # EXPR: its value, truncated

e2e_require() { # TOOL...: skips the run when one is missing; scripts/bootstrap installs them
    local tool
    for tool; do command -v "$tool" >/dev/null 2>&1 || e2e_skip "$tool is not installed; the end-to-end runs need the Debian packages xvfb, xdotool and imagemagick"; done
}

# On exit: ends the panel and the X server, then removes the run's files, or keeps them after a failure.
e2e_cleanup() {
    local status=$? pid f
    for pid in "$PANEL_PID" "$XVFB_PID"; do
        if [ -n "$pid" ] && kill "$pid" 2>/dev/null; then wait "$pid" 2>/dev/null || true; fi
    done
    [ -n "$E2E_DIR" ] || return 0
    if { [ "$status" -eq 0 ] || [ "$status" -eq 77 ]; } && [ "$E2E_KEEP" -eq 0 ]; then rm -rf "$E2E_DIR" && return 0; fi
    echo "The run's files (call trace, panel log, screenshots) are kept in $E2E_DIR" >&2
    for f in panel.log calls.txt; do
        if [ -s "$E2E_DIR/$f" ]; then echo "--- $f, last lines:" && tail -n 20 "$E2E_DIR/$f"; fi >&2
    done
}

# e2e_init PANEL: checks the tools and the executable, makes the run's folder and starts an X
# server of the run's own, on a display number it picks itself, so that parallel runs never share one.
e2e_init() {
    e2e_require Xvfb xdotool
    PANEL=${1:-}
    [ -n "$PANEL" ] && [ -x "$PANEL" ] || e2e_fail "no panel executable given (got '${PANEL}')"
    PANEL=$(cd "$(dirname "$PANEL")" && pwd)/$(basename "$PANEL")
    E2E_DIR=$(mktemp -d "${TMPDIR:-/tmp}/k7720-e2e.XXXXXX")
    trap e2e_cleanup EXIT
    trap 'exit 1' INT TERM
    Xvfb -displayfd 3 -screen 0 "${E2E_SCREEN_W}x${E2E_SCREEN_H}x24" -nolisten tcp -noreset \
        3>"$E2E_DIR/display" >"$E2E_DIR/xvfb.log" 2>&1 &
    XVFB_PID=$!
    e2e_wait 10 "the X server to start" test -s "$E2E_DIR/display"
    DISPLAY=":$(head -n 1 "$E2E_DIR/display")"
    export DISPLAY QT_QPA_PLATFORM=xcb
    unset WAYLAND_DISPLAY
    e2e_wait 10 "the X server to answer" xdotool getdisplaygeometry
}

# e2e_wait SECONDS WHAT COMMAND...: polls the command every tenth of a second until it succeeds.
e2e_wait() {
    local deadline=$((SECONDS + $1)) seconds=$1 what=$2
    shift 2
    until "$@" >/dev/null 2>&1; do
        [ "$SECONDS" -lt "$deadline" ] || e2e_fail "timed out after ${seconds}s waiting for $what"
        sleep 0.1
    done
}

# e2e_start_panel [NAME=VALUE...]: starts the panel in the run's folder (relative file names land
# there) with these variables added to the environment; the call trace goes to $TRACE.
e2e_start_panel() {
    TRACE="$E2E_DIR/calls.txt"
    : >"$TRACE"
    (cd "$E2E_DIR" && exec env -u OST7720_SIM_MODULES -u OST7720_SIM_FAIL OST7720_SIM_TRACE="$TRACE" "$@" "$PANEL" >>"$E2E_DIR/panel.log" 2>&1) &
    PANEL_PID=$!
}

e2e_panel_alive() { kill -0 "$PANEL_PID" 2>/dev/null; }

# e2e_wait_exit: waits for the panel to end and sets PANEL_STATUS to its exit status.
e2e_wait_exit() {
    e2e_wait "$E2E_TIMEOUT" "the panel to end" e2e_not e2e_panel_alive
    PANEL_STATUS=0 && wait "$PANEL_PID" || PANEL_STATUS=$?
    PANEL_PID=""
}

# Visible top-level windows with exactly this title, one id a line; their count; whether there are N.
e2e_windows() { xdotool search --onlyvisible --name "^$1\$" 2>/dev/null || true; }
e2e_window_count() { e2e_windows "$1" | grep -c . || true; }
e2e_windows_are() { [ "$(e2e_window_count "$2")" -eq "$1" ]; }  # N TITLE
e2e_one_window() { e2e_windows_are 1 "$1"; }

# e2e_wait_window TITLE: waits until exactly one visible window has this title; sets WIN to it.
e2e_wait_window() {
    e2e_wait "$E2E_TIMEOUT" "the window \"$1\"" e2e_one_window "$1"
    WIN=$(e2e_windows "$1")
}

# Waits for the main window after start-up: the session is open (its four channel groups are in
# the trace) and only one window with the panel's title is left, the splash having gone.
e2e_wait_main() {
    e2e_wait "$E2E_TIMEOUT" "the start-up to open the session" e2e_started
    e2e_wait_window "$APP_TITLE" && MAIN=$WIN
}

e2e_started() {
    e2e_panel_alive || e2e_fail "the panel ended during start-up: $(cat "$E2E_DIR/panel.log")"
    e2e_trace_has '^ost7720_createChannelGroup' 4
}

# e2e_wait_page TITLE: waits for a page to take the main window's place; sets PAGE.
e2e_wait_page() {
    e2e_wait_window "$1" && PAGE=$WIN
    e2e_wait "$E2E_TIMEOUT" "the main window to hand its place to \"$1\"" e2e_windows_are 0 "$APP_TITLE"
}

# e2e_back_to_main TITLE: waits for the page to give its place back to the main window.
e2e_back_to_main() {
    e2e_wait "$E2E_TIMEOUT" "the page \"$1\" to close" e2e_windows_are 0 "$1"
    e2e_wait_window "$APP_TITLE" && MAIN=$WIN
}

# e2e_wait_dialog MAIN: waits for a message box (a second window with the panel's title over the
# main window, or the only one during start-up: pass ""); sets DIALOG.
e2e_wait_dialog() {
    e2e_wait "$E2E_TIMEOUT" "a message box" e2e_dialog_shown "$1"
    DIALOG=$(e2e_windows "$APP_TITLE" | grep -vx "${1:-none}" | tail -n 1)
}

e2e_dialog_shown() { grep -vqx -- "${1:-none}" <<<"$(e2e_windows "$APP_TITLE")"; }

# e2e_geometry WID: sets GX GY GW GH to the window's place and size on the screen.
e2e_geometry() {
    local X Y WIDTH HEIGHT WINDOW SCREEN
    eval "$(xdotool getwindowgeometry --shell "$1")"
    GX=$X GY=$Y GW=$WIDTH GH=$HEIGHT
}

# e2e_at WID FX FY [DX DY]: sets PX PY to the screen point at fractions FX, FY of the window's
# width and height, moved by DX, DY pixels.
e2e_at() {
    e2e_geometry "$1"
    PX=$(e2e_int "$GX + $GW * ($2) + (${4:-0})")
    PY=$(e2e_int "$GY + $GH * ($3) + (${5:-0})")
}

e2e_click() { e2e_at "$@" && xdotool mousemove "$PX" "$PY" click 1; }  # WID FX FY [DX DY]

# e2e_type WID FX FY DX DY TEXT: clicks into a text box, selects what it holds and types TEXT over it.
e2e_type() { e2e_click "$1" "$2" "$3" "$4" "$5" && xdotool key ctrl+a && xdotool type --delay 5 -- "$6"; }

# e2e_key WID KEY...: keys to a window, with the pointer over it (no window manager: the
# keyboard follows the pointer) and the input focus set to it.
e2e_key() {
    e2e_at "$1" 0.5 0.5 && xdotool mousemove "$PX" "$PY"
    xdotool windowfocus "$1" 2>/dev/null || true
    shift && xdotool key "$@"
}

e2e_shot() { import -window "$1" "$2"; }  # WID FILE: the window's pixels as PNG

# The main window's buttons: the column is centred at 0.9 of the width, button k (1..5) 0.05 high
# with its top at 0.07 k; Go and Exit are 0.15 wide and 0.145 high at the bottom, Go 50 twips from
# the left edge, Exit 0.18 of the width from the right edge.
main_button() {
    local k
    case $1 in
        Go) e2e_click "$MAIN" 0.075 0.9275 3 0 ;;
        Exit) e2e_click "$MAIN" 0.895 0.9275 ;;
        Meas) k=1 ;; Input) k=2 ;; Source) k=3 ;; Display) k=4 ;; VXI) k=5 ;;
        *) e2e_fail "no main-window button $1" ;;
    esac
    if [ -n "${k:-}" ]; then e2e_click "$MAIN" 0.9 "0.07 * $k + 0.025"; fi
}

# OK and Cancel of every page: an eighth of the width wide, a fifteenth of the height high, OK's
# left at a sixteenth of the width, Cancel 1.5 widths further; their top 1.5 heights and 400
# twips above the bottom.
page_ok() { e2e_click "$PAGE" 0.125 0.9333 0 -27; }
page_cancel() { e2e_click "$PAGE" 0.3125 0.9333 0 -27; }

# The measurement page's option buttons: frames at a tenth of the width, the "Meas " frame 2/14
# high from 1/14, "Mode" the same from 4/14, "Trigger" 4/14 high from 7/14; each button's text
# starts some 25 pixels into its frame.
meas_option() {
    local y
    case $1 in
        Single) y=0.119 ;; Repeat) y=0.1667 ;; Block) y=0.3333 ;;
        Continuous) y=0.381 ;; Auto) y=0.5571 ;; Manual) y=0.6143 ;;
        *) e2e_fail "no measurement option $1" ;;
    esac
    e2e_click "$PAGE" 0.1 "$y" 30 8
}

# Repeat chosen on the Measurement page, then OK.
e2e_choose_repeat() {
    main_button Meas
    e2e_wait_page "Measurement Control"
    meas_option Repeat
    page_ok
    e2e_back_to_main "Measurement Control"
}

# The Display page: trace row i (0..3) at (i + 2) / 7 of the height; the channel box at 3/8 and
# the file box at 5/8 of the width. ROW TEXT.
disp_channel() { e2e_type "$PAGE" 0.375 "($1 + 2) / 7" 20 11 "$2"; }
disp_file() { e2e_type "$PAGE" 0.625 "($1 + 2) / 7" 40 10 "$2"; }

# The Input and Source pages place their fields on a grid: place i (0..15) has its top at
# (1 + 2 (i mod 8)) / 18 of the height and its left at 2/12 of the width for places 0..7, 7/12
# for 8..15; the check box of place 0 at 1.5/12. PLACE TEXT.
grid_field() { e2e_type "$PAGE" "($1 < 8 ? 2 : 7) / 12" "(1 + 2 * ($1 % 8)) / 18" 20 10 "$2"; }
grid_check_box() { e2e_click "$PAGE" 0.125 0.0556 7 8; }

# Call-trace checks, with extended regular expressions.
e2e_trace_count() { grep -cE -- "$1" "$TRACE" || true; }            # PATTERN: lines matching
e2e_trace_has() { [ "$(e2e_trace_count "$1")" -ge "${2:-1}" ]; }     # PATTERN [N]: at least N (1)
e2e_trace_lines() { wc -l <"$TRACE"; }                               # calls so far, to look at later ones
e2e_trace_since() { tail -n +"$(($1 + 1))" "$TRACE"; }               # N: the calls after the first N
e2e_trace_since_has() { grep -qE -- "$2" < <(e2e_trace_since "$1"); } # N PATTERN
e2e_reads() { e2e_trace_count "^ost7720_readFloat64Data\\([0-9]+, $1, .* -> 0 "; }  # CHANNEL: blocks read
e2e_reads_reach() { [ "$(e2e_reads "$1")" -ge "$2" ]; }              # CHANNEL N

# The call that resets the measurement: the end of every run.
E2E_RESET='^ost7720_resetMeasure\([0-9]+, [0-9]+\) -> 0$'

# Stops a repeat run with Go, captioned Stop while it runs. While a block is read the button
# shows "Reading" and is disabled, so a click then is lost, for a user as for this script: when
# the poll has run twice since the click and the measurement was not reset, click again.
e2e_stop_run() {
    local before tries
    for tries in 1 2 3 4 5; do
        before=$(e2e_trace_lines)
        main_button Go
        e2e_wait "$E2E_TIMEOUT" "Stop to reset the measurement or the poll to go on" e2e_stopped_or_polled "$before"
        if e2e_trace_since_has "$before" "$E2E_RESET"; then return 0; fi
        e2e_note "Stop came while a block was read (click $tries lost); clicking again"
    done
    e2e_fail "Stop did not stop the run"
}

e2e_stopped_or_polled() {
    e2e_trace_since_has "$1" "$E2E_RESET" ||
        [ "$(e2e_trace_since "$1" | grep -cE '^ost7720_blockAvailable')" -ge 2 ]
}
