#!/bin/bash
# Files dropped on a real window from another program.
#
#   mouse-drop.sh GLIMMET WORKDIR
#
# The other program is the drag source built with the tests (its path in
# GLIMMET_DRAG_SOURCE, or next to the tests in the build tree): a small
# window that starts a drag with a file's URL when it is pressed. The drag
# runs over X's drag-and-drop protocol between the two programs, as from a
# file manager.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/mouse.sh"
e2e_begin "$@"

drag_source=${GLIMMET_DRAG_SOURCE:-$(dirname "$GLIMMET")/tests/glimmet-drag-source}
[ -x "$drag_source" ] || fail "no drag source program at $drag_source (set GLIMMET_DRAG_SOURCE)"

make_stereo first.wav 1
sox -n -r 44100 -c 1 -b 16 mono.wav synth 0.5 sine 440 vol 0.5
make_stereo stereo.wav 1.5
launch first.wav

# Starts a drag source for file $1 under the editor's window and drops its
# file on the middle of channel 0's view, with key $2 (or none) held for the
# drop.
drop_file() {
    local file=$1 key=${2:-} source x0 y0 x1 y1 steps=16
    "$drag_source" "$file" "Drag Source $file" >>"drag-source-$file.log" 2>&1 &
    E2E_PIDS="$E2E_PIDS $!"
    source=$(wait_window "^Drag Source $file\$")
    # Out of the editor's way: under it on the screen.
    xdotool windowmove --sync "$source" 40 500
    for _ in $(seq 50); do
        eval "$(xdotool getwindowgeometry --shell "$source")"
        [ "$Y" -ge 500 ] && break
        sleep 0.1
    done
    x0=$((X + 60))
    y0=$((Y + 40))
    read -r x1 y1 <<<"$(view_point 0)"
    xdotool mousemove --sync "$x0" "$y0" mousedown 1
    sleep 0.2
    # The drag needs pointer motion over the target to negotiate the drop.
    for ((step = 1; step <= steps; step++)); do
        xdotool mousemove $((x0 + (x1 - x0) * step / steps)) $((y0 + (y1 - y0) * step / steps))
        sleep 0.05
    done
    xdotool mousemove $((x1 + 3)) "$y1"
    sleep 0.2
    xdotool mousemove "$x1" "$y1"
    sleep 0.2
    [ -n "$key" ] && xdotool keydown "$key"
    xdotool mouseup 1
    sleep 0.1
    [ -n "$key" ] && xdotool keyup "$key"
    return 0
}

# A plain drop opens the file in the window it is dropped on.
drop_opens() {
    drop_file mono.wav
    expect_soon '.title' "Glimmet - mono.wav" "title after dropping mono.wav"
    expect_soon '[.frames, (.channels | length)] | @csv' "22050,1" "length and channels after dropping mono.wav"
}

# With Shift held the file's channels are added to the document.
shift_drop_appends() {
    local before
    before=$(state_field '.channels | length')
    drop_file stereo.wav shift
    expect_soon '.channels | length' $((before + 2)) "channels after dropping stereo.wav with Shift"
    expect_soon '.frames' 66150 "length after dropping stereo.wav with Shift"
}

run_case drop_opens
run_case shift_drop_appends
finish_cases
