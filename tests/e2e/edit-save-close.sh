#!/bin/bash
# Runs the real editor in a real X server the way a person uses it, then does
# the same steps through the batch mode and compares the saved files.
#
#   real-window.sh GLIMMET WORKDIR
#
# Steps in the window: open a file named on the command line, drag a range
# across both channels, "Fade Out" from the Tools menu, undo and redo with the
# keyboard, "Save As…" through the save panel, "Fade In" by its shortcut,
# then close the window and answer "Yes, please." to "Save changes?".
# Screenshots stay in WORKDIR for inspection.
set -euo pipefail

glimmet=$(realpath "$1")
work=$2
rm -rf "$work"
mkdir -p "$work"
cd "$work"

fail() {
    echo "FAIL: $*" >&2
    exit 1
}

# --- A private X server and a clean environment -----------------------------

Xvfb -displayfd 5 -screen 0 1024x768x24 -nolisten tcp 5>display.txt 2>xvfb.log &
xvfb=$!
app=""
cleanup() {
    [ -n "$app" ] && kill "$app" 2>/dev/null || true
    kill "$xvfb" 2>/dev/null || true
}
trap cleanup EXIT
for _ in $(seq 100); do
    [ -s display.txt ] && break
    sleep 0.1
done
[ -s display.txt ] || fail "Xvfb did not start"
export DISPLAY=":$(head -1 display.txt)"
export QT_QPA_PLATFORM=xcb
export SDL_AUDIODRIVER=dummy
export GLIMMET_INSTANCE="glimmet-real-window-$$"
export XDG_CONFIG_HOME="$work/config"
export XDG_RUNTIME_DIR="$work/runtime"
mkdir -p "$XDG_CONFIG_HOME" "$XDG_RUNTIME_DIR"
chmod 700 "$XDG_RUNTIME_DIR"
# The editor's own leak check would report the toolkit's lifetime caches.
export ASAN_OPTIONS="${ASAN_OPTIONS:-}:detect_leaks=0"

# --- Helpers ---------------------------------------------------------------

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

# One integer field of the batch mode's JSON state.
json_view() {
    # "view": [X, Y, W, H] of channel $2 (0-based) in state line $1.
    echo "$1" | grep -o '"view": \[[0-9, ]*\]' | sed -n "$(($2 + 1))p" | grep -o '[0-9]\+' | tr '\n' ' '
}

screenshot() {
    import -window root "$1"
}

# --- The input file and the layout ----------------------------------------

sox -n -r 44100 -c 2 -b 16 in.wav synth 2 sine 300 sine 500 vol 0.5

state=$(printf 'open %s\nprint\n' "$work/in.wav" | "$glimmet" --batch - 2>batch-layout.log | grep '^{')
read -r v0x v0y v0w v0h <<<"$(json_view "$state" 0)"
read -r v1x v1y v1w v1h <<<"$(json_view "$state" 1)"

# --- The real window ---------------------------------------------------------

"$glimmet" in.wav >app.log 2>&1 &
app=$!
window=$(wait_window '^Glimmet - in.wav$')
geometry=$(xdotool getwindowgeometry --shell "$window")
eval "$geometry"
wx=$X
wy=$Y
[ "$WIDTH" = 701 ] && [ "$HEIGHT" = 301 ] || fail "the window is ${WIDTH}x$HEIGHT, expected 701x301"
xdotool windowfocus --sync "$window"
sleep 0.3
screenshot 01-opened.png

# Drag from a third of the way into channel 0 to over half way into channel 1.
start_x=$((wx + v0x + v0w / 4))
start_y=$((wy + v0y + v0h / 2))
end_x=$((wx + v1x + v1w * 3 / 5))
end_y=$((wy + v1y + v1h / 2))
xdotool mousemove "$start_x" "$start_y" mousedown 1
for step in 1 2 3 4 5 6 7 8; do
    xdotool mousemove $((start_x + (end_x - start_x) * step / 8)) $((start_y + (end_y - start_y) * step / 8))
    sleep 0.05
done
xdotool mouseup 1

# The range is coloured in both channels: an empty row inside the range is
# black, outside it light grey. Channel 0 was clicked and has the focus frame.
middle_x=$(((start_x + end_x) / 2))
outside_x=$((wx + v0x + v0w / 8))
await_pixel 02-dragged.png "$middle_x" $((wy + v1y + 1)) "0,0,0" "channel 1 inside the range"
for channel in 0 1; do
    if [ $channel = 0 ]; then top=$((wy + v0y + 1)); else top=$((wy + v1y + 1)); fi
    expect_pixel 02-dragged.png "$middle_x" "$top" "0,0,0" "channel $channel inside the range"
    expect_pixel 02-dragged.png "$outside_x" "$top" "245,245,245" "channel $channel outside the range"
done
expect_pixel 02-dragged.png $((wx + v0x - 1)) $((wy + v0y + v0h / 2)) "0,0,229" "focus frame of channel 0"
expect_pixel 02-dragged.png $((wx + v1x - 1)) $((wy + v1y + v1h / 2)) "152,152,152" "plain frame of channel 1"

# Tools > Fade Out: open the first menu, walk right to Tools, take its
# second item.
xdotool mousemove $((wx + 20)) $((wy + 8)) click 1
sleep 0.4
xdotool key Right Right Right
sleep 0.3
screenshot 03-tools-menu.png
xdotool key Down Return
sleep 0.5
screenshot 04-faded.png

xdotool key ctrl+z
sleep 0.3
xdotool key ctrl+shift+z
sleep 0.3

# Save As through the save panel.
xdotool key ctrl+shift+s
panel=$(wait_window '^Save As$')
xdotool windowfocus --sync "$panel"
sleep 0.3
screenshot 05-save-panel.png
xdotool type --delay 10 "$work/gui.wav"
xdotool key Return
window=$(wait_window '^Glimmet - gui.wav$')
# The file appears whole: it is written under another name and renamed.
for _ in $(seq 100); do
    [ -f gui.wav ] && break
    sleep 0.1
done
[ -f gui.wav ] || fail "Save As wrote no file"
cp gui.wav gui-first.wav

# One more edit, so that closing asks about saving.
xdotool windowfocus --sync "$window"
sleep 0.3
xdotool key ctrl+i
sleep 0.5

# What the range fields say, read as a user would: a triple click selects
# the end field's text (the primary selection); Shift+Tab moves to the start
# field, selecting its text, which Ctrl+C copies.
xdotool mousemove $((wx + WIDTH - 40)) $((wy + 35)) click --repeat 3 1
sleep 0.3
range_end=$(xclip -o -selection primary)
xdotool key shift+Tab
sleep 0.2
xdotool key ctrl+c
sleep 0.3
range_start=$(xclip -o -selection clipboard)
[[ "$range_start" =~ ^[0-9]+$ && "$range_end" =~ ^[0-9]+$ ]] \
    || fail "range fields read '$range_start' and '$range_end'"
screenshot 06-before-close.png

xdotool windowfocus --sync "$window"
xdotool key ctrl+w
alert=""
for _ in $(seq 100); do
    for id in $(xdotool search --onlyvisible --name '' 2>/dev/null); do
        [ "$id" != "$window" ] && alert=$id
    done
    [ -n "$alert" ] && break
    sleep 0.1
done
[ -n "$alert" ] || fail "closing did not ask \"Save changes?\""
xdotool windowfocus --sync "$alert"
sleep 0.3
screenshot 07-save-changes.png
# The default button is "Don't quit!"; "Yes, please." is the one before it.
xdotool key shift+Tab space
for _ in $(seq 100); do
    kill -0 "$app" 2>/dev/null || break
    sleep 0.1
done
kill -0 "$app" 2>/dev/null && fail "the editor did not end after the answer"
wait "$app" || fail "the editor ended with status $?"
app=""

# --- The same steps through the batch mode ----------------------------------

steps="open $work/in.wav
range $range_start $range_end
select 0 1
focus 0
fdot
undo
redo"
printf '%s\nsaveas %s\n' "$steps" "$work/batch-first.wav" | "$glimmet" --batch - >batch-1.log 2>&1 \
    || fail "batch run 1 failed: $(cat batch-1.log)"
printf '%s\nsaveas %s\nfocus 0\nfdin\nanswer yes\n_QRQ\n' "$steps" "$work/batch.wav" \
    | "$glimmet" --batch - >batch-2.log 2>&1 || fail "batch run 2 failed: $(cat batch-2.log)"

cmp gui-first.wav batch-first.wav || fail "the saved file differs from the batch mode's"
cmp gui.wav batch.wav || fail "the file saved on closing differs from the batch mode's"
cmp -s gui-first.wav gui.wav && fail "closing with \"Yes, please.\" did not save the last edit"
cmp -s in.wav gui-first.wav && fail "the fade changed nothing"
echo "real window: range $range_start..$range_end, files identical to the batch mode's"
