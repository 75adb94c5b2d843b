#!/bin/bash
# Runs the real editor the way a person uses it, then does the same steps
# through the batch mode and compares the saved files.
#
# Steps in the window: open a file named on the command line, drag a range
# across both channels, "Fade Out" from the Tools menu, undo and redo with the
# keyboard, "Save As…" through the save panel, "Fade In" by its shortcut,
# then close the window and answer "Yes, please." to "Save changes?".
# Screenshots stay in WORKDIR for inspection.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav
launch in.wav
eval "$(xdotool getwindowgeometry --shell "$window")"
[ "$WIDTH" = 701 ] && [ "$HEIGHT" = 301 ] || fail "the window is ${WIDTH}x$HEIGHT, expected 701x301"
screenshot 01-opened.png

# Drag from a quarter of the way into channel 0 to 0.6 into channel 1.
read -r start_x start_y <<<"$(view_point 0 0.25 0.5)"
read -r end_x end_y <<<"$(view_point 1 0.6 0.5)"
drag "$start_x" "$start_y" "$end_x" "$end_y"

# The range is coloured in both channels: an empty row inside the range is
# black, outside it light grey. Channel 0 was clicked and has the focus frame.
middle_x=$(((start_x + end_x) / 2))
read -r outside_x _ <<<"$(view_point 0 0.125 0.5)"
read -r _ top0 <<<"$(view_pixel 0 0 1)"
read -r _ top1 <<<"$(view_pixel 1 0 1)"
await_pixel 02-dragged.png "$middle_x" "$top1" "0,0,0" "channel 1 inside the range"
for top in "$top0" "$top1"; do
    expect_pixel 02-dragged.png "$middle_x" "$top" "0,0,0" "inside the range at row $top"
    expect_pixel 02-dragged.png "$outside_x" "$top" "245,245,245" "outside the range at row $top"
done
read -r left0 middle0 <<<"$(view_pixel 0 -1 50)"
read -r left1 middle1 <<<"$(view_pixel 1 -1 50)"
expect_pixel 02-dragged.png "$left0" "$middle0" "0,0,229" "focus frame of channel 0"
expect_pixel 02-dragged.png "$left1" "$middle1" "152,152,152" "plain frame of channel 1"

menu_open_at "$MENU_TOOLS" 1
screenshot 03-tools-menu.png
xdotool key Return
expect_state '.undo' "Fade Out" "Tools > Fade Out"
screenshot 04-faded.png

xdotool key ctrl+z
expect_state '.redo' "Fade Out" "Ctrl+Z"
xdotool key ctrl+shift+z
expect_state '.undo' "Fade Out" "Ctrl+Shift+Z"

# Save As through the save panel.
xdotool key ctrl+shift+s
screenshot 05-save-panel.png
choose_in_panel "Save As" "$PWD/gui.wav"
window=$(wait_window '^Glimmet - gui.wav$')
await_file gui.wav
cp gui.wav gui-first.wav

# One more edit, so that closing asks about saving.
reactivate
xdotool key ctrl+i
expect_state '.undo' "Fade In" "Ctrl+I"

# What the range fields say, read as a user would: a triple click selects
# the end field's text (the primary selection); Shift+Tab moves to the start
# field, selecting its text, which Ctrl+C copies.
read -r wx wy <<<"$(window_box)"
xdotool mousemove --sync $((wx + WIDTH - 40)) $((wy + 35)) click --repeat 3 1
sleep 0.3
range_end=$(xclip -o -selection primary)
xdotool key shift+Tab
sleep 0.2
xdotool key ctrl+c
sleep 0.3
range_start=$(xclip -o -selection clipboard)
[[ "$range_start" =~ ^[0-9]+$ && "$range_end" =~ ^[0-9]+$ ]] \
    || fail "range fields read '$range_start' and '$range_end'"
expect_state '.range' "[$range_start,$range_end]" "the range fields tell the range"
screenshot 06-before-close.png

xdotool key ctrl+w
await_alert "the edited window"
screenshot 07-save-changes.png
# The default button is "Don't quit!"; "Yes, please." is the one before it.
xdotool key shift+Tab space
await_exit "after the answer"

# --- The same steps through the batch mode ----------------------------------

steps="open $PWD/in.wav
range $range_start $range_end
select 0 1
focus 0
fdot
undo
redo"
printf '%s\nsaveas %s\n' "$steps" "$PWD/batch-first.wav" | batch >/dev/null
printf '%s\nsaveas %s\nfocus 0\nfdin\nanswer yes\n_QRQ\n' "$steps" "$PWD/batch.wav" | batch >/dev/null

cmp gui-first.wav batch-first.wav || fail "the saved file differs from the batch mode's"
cmp gui.wav batch.wav || fail "the file saved on closing differs from the batch mode's"
cmp -s gui-first.wav gui.wav && fail "closing with \"Yes, please.\" did not save the last edit"
cmp -s in.wav gui-first.wav && fail "the fade changed nothing"
echo "real window: range $range_start..$range_end, files identical to the batch mode's"
