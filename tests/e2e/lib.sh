# Shared by every real-window case: a private X server with a window
# manager, the editor started in it, and ways to look at what it did.
#
# A case script starts with
#     . "$(dirname "$0")/lib.sh"
#     e2e_begin "$@"            # GLIMMET WORKDIR
# and then drives the editor with xdotool. What a window did is read back
# through `glimmet --state` (one line of JSON per window: the batch mode's
# state plus "screen", "active", "playing" and "fields") or from
# screenshots. Screenshots stay in WORKDIR for inspection.

set -euo pipefail

fail() {
    echo "FAIL: $*" >&2
    [ -n "${E2E_WORK:-}" ] && [ -f "${E2E_WORK}/app.log" ] && sed 's/^/app: /' "$E2E_WORK/app.log" >&2
    exit 1
}

note() {
    echo "-- $*"
}

# --- The X server, the window manager and the environment -------------------

e2e_begin() {
    GLIMMET=$(realpath "$1")
    E2E_WORK=$2
    rm -rf "$E2E_WORK"
    mkdir -p "$E2E_WORK"
    cd "$E2E_WORK"
    E2E_PIDS=""
    app=""
    trap e2e_cleanup EXIT

    Xvfb -displayfd 5 -screen 0 1024x768x24 -nolisten tcp 5>display.txt 2>xvfb.log &
    E2E_PIDS="$!"
    for _ in $(seq 100); do
        [ -s display.txt ] && break
        sleep 0.1
    done
    [ -s display.txt ] || fail "Xvfb did not start"
    export DISPLAY=":$(head -1 display.txt)"
    export QT_QPA_PLATFORM=xcb
    export SDL_AUDIODRIVER=${SDL_AUDIODRIVER:-dummy}
    export GLIMMET_INSTANCE="glimmet-e2e-$$"
    export XDG_CONFIG_HOME="$E2E_WORK/config"
    export XDG_RUNTIME_DIR="$E2E_WORK/runtime"
    mkdir -p "$XDG_CONFIG_HOME" "$XDG_RUNTIME_DIR"
    chmod 700 "$XDG_RUNTIME_DIR"
    # The editor's own leak check would report the toolkit's lifetime caches.
    export ASAN_OPTIONS="${ASAN_OPTIONS:-}:detect_leaks=0"

    start_window_manager || start_window_manager || fail "the window manager did not start"
}

# Starts openbox and waits until it manages the screen; false when it ended.
start_window_manager() {
    openbox --sm-disable >>openbox.log 2>&1 &
    local wm=$!
    E2E_PIDS="$E2E_PIDS $wm"
    for _ in $(seq 100); do
        xprop -root _NET_SUPPORTING_WM_CHECK 2>/dev/null | grep -q 'window id' && return 0
        kill -0 "$wm" 2>/dev/null || return 1
        sleep 0.1
    done
    return 1
}

e2e_cleanup() {
    [ -n "${app:-}" ] && kill "$app" 2>/dev/null || true
    for pid in ${E2E_PIDS:-}; do
        kill "$pid" 2>/dev/null || true
    done
    # The X server is gone, its socket and lock file with it, before the
    # next session picks a display: a server still on its way out would
    # remove the socket of a new one that took the same number.
    for pid in ${E2E_PIDS:-}; do
        wait "$pid" 2>/dev/null || true
    done
}

# --- The editor ------------------------------------------------------------

# Starts the editor with the given arguments and waits until a window titled
# "Glimmet - NAME" (or "Glimmet" without files) is visible and answers.
# Sets $app and $window.
launch() {
    "$GLIMMET" "$@" >>app.log 2>&1 &
    app=$!
    local title='^Glimmet$'
    [ $# -gt 0 ] && title="^Glimmet - $(basename "$1")\$"
    window=$(wait_window "$title")
    xdotool windowactivate --sync "$window" 2>/dev/null || xdotool windowfocus --sync "$window"
    for _ in $(seq 100); do
        [ "$(state_field '.active')" = true ] && break
        sleep 0.1
    done
    sleep 0.2
}

# Asks the editor to end and waits for it. Answers nothing.
quit_app() {
    [ -n "$app" ] || return 0
    kill "$app" 2>/dev/null || true
    wait "$app" 2>/dev/null || true
    app=""
}

# Waits until the editor process has ended by itself; fails after 10 s.
await_exit() {
    for _ in $(seq 100); do
        kill -0 "$app" 2>/dev/null || break
        sleep 0.1
    done
    kill -0 "$app" 2>/dev/null && fail "the editor did not end: $*"
    wait "$app" || fail "the editor ended with status $?"
    app=""
}

# Every window's state, one JSON line each.
state() {
    "$GLIMMET" --state
}

# A jq expression evaluated on the state of window $2 (default 0), raw.
state_field() {
    state | sed -n "$((${2:-0} + 1))p" | jq -r -c "$1"
}

# Waits up to five seconds for `state_field EXPR` to print EXPECTED.
#   expect_state EXPR EXPECTED WHAT [WINDOW]
expect_state() {
    local got=""
    for _ in $(seq 50); do
        got=$(state_field "$1" "${4:-0}" 2>/dev/null || true)
        [ "$got" = "$2" ] && return 0
        sleep 0.1
    done
    fail "$3: $1 is '$got', expected '$2'"
}

# Waits until the state stops changing for a moment, for steps whose
# outcome is "nothing happened".
settle() {
    sleep "${1:-0.4}"
}

# The screen coordinates of a point of channel $1's sample view, given as
# fractions of its width and height ($2, $3, default the middle).
#   read -r x y <<<"$(view_point 0 0.25 0.5)"
view_point() {
    state | sed -n 1p | jq -r --argjson c "$1" --argjson fx "${2:-0.5}" --argjson fy "${3:-0.5}" \
        '[(.screen[0] + .channels[$c].view[0] + (.channels[$c].view[2] * $fx | floor)),
          (.screen[1] + .channels[$c].view[1] + (.channels[$c].view[3] * $fy | floor))] | @tsv'
}

# The screen coordinates of channel $1's view pixel ($2, $3), in pixels.
view_pixel() {
    state | sed -n 1p | jq -r --argjson c "$1" --argjson px "$2" --argjson py "$3" \
        '[(.screen[0] + .channels[$c].view[0] + $px), (.screen[1] + .channels[$c].view[1] + $py)] | @tsv'
}

# The window's top left on the screen and its size.
window_box() {
    state | sed -n "$((${1:-0} + 1))p" | jq -r '[.screen[0], .screen[1]] | @tsv'
}

# --- Windows and pixels ----------------------------------------------------

# Waits for a visible window whose name matches $1 and prints its id.
wait_window() {
    local id=""
    for _ in $(seq 300); do
        id=$(xdotool search --onlyvisible --name "$1" 2>/dev/null | head -1 || true)
        if [ -n "$id" ]; then
            echo "$id"
            return 0
        fi
        sleep 0.1
    done
    fail "no window named '$1' appeared"
}

screenshot() {
    import -window root "$1"
}

# The red, green and blue of one pixel of a screenshot, as "r,g,b".
pixel() {
    convert "$1" -format "%[fx:round(255*p{$2,$3}.r)],%[fx:round(255*p{$2,$3}.g)],%[fx:round(255*p{$2,$3}.b)]" info:
}

expect_pixel() {
    local got
    got=$(pixel "$1" "$2" "$3")
    [ "$got" = "$4" ] || fail "$1 at ($2, $3) is $got, expected $4 ($5)"
}

# Takes screenshot $1 again and again (a slow build may still be drawing)
# until pixel ($2, $3) is $4, for up to ten seconds.
await_pixel() {
    for _ in $(seq 50); do
        screenshot "$1"
        [ "$(pixel "$1" "$2" "$3")" = "$4" ] && return 0
        sleep 0.2
    done
    expect_pixel "$@"
}

# --- Input -----------------------------------------------------------------

# Moves the pointer to ($1, $2) and waits until it is there. A move to
# where the pointer already is would make `xdotool mousemove --sync` wait
# for a motion that never comes.
pointer_to() {
    local X Y SCREEN WINDOW
    eval "$(xdotool getmouselocation --shell)"
    [ "$X" = "$1" ] && [ "$Y" = "$2" ] && return 0
    xdotool mousemove --sync "$1" "$2"
}

# Presses button $3 (default 1) at ($1, $2) and releases it there.
click_at() {
    pointer_to "$1" "$2"
    xdotool click "${3:-1}"
}

# Drags with button $5 (default 1) from ($1, $2) to ($3, $4) in eight steps.
drag() {
    local button=${5:-1}
    pointer_to "$1" "$2"
    xdotool mousedown "$button"
    for step in 1 2 3 4 5 6 7 8; do
        xdotool mousemove $(($1 + ($3 - $1) * step / 8)) $(($2 + ($4 - $2) * step / 8))
        sleep 0.04
    done
    xdotool mouseup "$button"
}

# A stereo test file: two seconds, two tones at half scale.
make_stereo() {
    sox -n -r 44100 -c 2 -b 16 "$1" synth "${2:-2}" sine 300 sine 500 vol 0.5
}
