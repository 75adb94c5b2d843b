#!/bin/bash
# "FIR Filter…" from the Tools menu of a real window: the dialog comes up
# modal for its own document window only, a point is added to its curve with
# the mouse, "Ok" filters, and the saved samples equal the batch mode's for
# the same points.
#
#   fir-dialog.sh GLIMMET WORKDIR
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav 1
cp in.wav original.wav
make_stereo other.wav 1
launch in.wav
# A range across both channels, dragged from 10 % into channel 0 to 70 %
# into channel 1.
read -r start_x start_y <<<"$(view_point 0 0.1 0.5)"
read -r end_x end_y <<<"$(view_point 1 0.7 0.5)"
drag "$start_x" "$start_y" "$end_x" "$end_y"
expect_state '[.channels[].selected] | @csv' "true,true" "the drag across both channels"
range=$(state_field '.range | @tsv')
read -r start end <<<"$range"
[ $((end - start)) -gt 20000 ] || fail "the dragged range $start..$end is too short"

menu_pick "$MENU_TOOLS" 6
wait_window '^FIR Filter$' >/dev/null
expect_state '.dialog.title' "FIR Filter" "Tools > FIR Filter…"
expect_state '.dialog.passes' 10 "the tap count a filter starts with"
screenshot 01-dialog.png

# The point to add: 40 % across the curve, 20 % down from its top.
read -r left top right bottom <<<"$(state_field '.dialog.area | @tsv')"
click_x=$(awk -v l="$left" -v r="$right" 'BEGIN { printf "%d", l + 0.4 * (r - l) + 0.5 }')
click_y=$(awk -v t="$top" -v b="$bottom" 'BEGIN { printf "%d", t + 0.2 * (b - t) + 0.5 }')
click_at "$click_x" "$click_y"
expect_state '.dialog.points | length' 3 "a click on the curve adds a point"
screenshot 02-point-added.png
# The curve passes through the new point: its pixel is red, the point's mark.
expect_pixel 02-point-added.png "$click_x" "$click_y" "255,0,0" "the added point"
points=$(state_field '.dialog.points')

# Modal for this window only: a click into the document is refused while
# the dialog is open, and a second document window works as usual.
read -r doc_x doc_y <<<"$(view_point 0 0.9 0.5)"
click_at "$doc_x" "$doc_y"
settle
expect_state '.range | @tsv' "$range" "a click into the document behind its dialog"
"$GLIMMET" other.wav >>app.log 2>&1
other=$(wait_window '^Glimmet - other.wav$')
xdotool windowactivate --sync "$other" 2>/dev/null || true
expect_state '.title' "Glimmet - other.wav" "the second window" 1
read -r other_x other_y <<<"$(state | sed -n 2p | jq -r '[(.screen[0] + .channels[0].view[0] + 100), (.screen[1] + .channels[0].view[1] + 20)] | @tsv')"
click_at "$other_x" "$other_y"
xdotool key ctrl+a
expect_state '[.channels[].selected] | @csv' "true,true" "Ctrl+A in the second window" 1
expect_state '.dialog.title' "FIR Filter" "the dialog after working in the other window"

# "Ok" with the mouse.
read -r ok_x ok_y <<<"$(state_field '.dialog.ok | @tsv')"
xdotool windowactivate --sync "$(wait_window '^FIR Filter$')" 2>/dev/null || true
click_at "$ok_x" "$ok_y"
expect_state '.undo' "FIR Filter" "Ok"
expect_state '.dialog.title' null "the FIR dialog closes when it has run"
screenshot 03-filtered.png

xdotool windowactivate --sync "$window" 2>/dev/null || true
xdotool key ctrl+s
expect_state '.saved' true "Ctrl+S"
cmp -s in.wav original.wav && fail "the filter changed nothing"

# --- The same through the batch mode, with the points the window stored ------
read -r px py <<<"$(jq -r '.[1] | @tsv' <<<"$points")"
printf 'open %s\nrange %s %s\nselect 0 1\nfltr\ncurve click %s %s\ndialog\nok\nsaveas %s\n' \
    "$PWD/original.wav" "$start" "$end" "$px" "$py" "$PWD/batch.wav" | batch >batch-dialog.txt
batch_points=$(jq -c '.points' <batch-dialog.txt)
[ "$batch_points" = "$(jq -c . <<<"$points")" ] \
    || fail "the batch mode stored $batch_points for the window's points $points"
cmp in.wav batch.wav || fail "the window's filtered file differs from the batch mode's"
echo "real window: point $px $py, file identical to the batch mode's"
