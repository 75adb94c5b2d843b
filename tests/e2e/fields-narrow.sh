#!/bin/bash
# A range field too narrow for its number shows the number's start.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

# Three seconds: a drag past the end ends the range at 132300, six digits.
sox -n -r 44100 -c 2 -b 16 in.wav synth 3 sine 300 sine 500 vol 0.5
launch in.wav
read -r from_x y <<<"$(view_point 0 0 0.5)"
read -r to_x _ <<<"$(view_point 0 1 0.5)"
drag "$from_x" "$y" $((to_x + 30)) "$y"
expect_state '[.range, .fields]' '[[0,132300],["0","132300"]]' "a drag over the whole channel puts the range into the fields"

note "the window at its narrowest"
xdotool windowsize --sync "$window" 50 301 2>/dev/null || xdotool windowsize "$window" 50 301
sleep 0.5
expect_state '[.fields, .display]' '[["0","132300"],[0,132299]]' "the narrow window keeps the range and shows all"
read -r wx wy <<<"$(window_box)"
sleep 0.3
screenshot narrow.png
read -r left right <<<"$(white_runs narrow.png $((wy + 27)) | tail -1)"
[ -n "$left" ] || fail "no range field in narrow.png"
width=$((right - left + 1))
note "end field $left..$right"
# Where the text is drawn: inside the frame, clear of the right edge.
convert narrow.png -crop "$((width - 6))x16+$((left + 1))+$((wy + 28))" +repage narrow-field.png

note "the same field wide enough for the whole number"
xdotool windowsize --sync "$window" 701 301 2>/dev/null || xdotool windowsize "$window" 701 301
sleep 0.5
read -r wx wy <<<"$(window_box)"
screenshot wide.png
read -r wide_left wide_right <<<"$(white_runs wide.png $((wy + 27)) | tail -1)"
[ $((wide_right - wide_left + 1)) -gt $((width + 30)) ] || fail "the field did not widen ($wide_left..$wide_right)"
convert wide.png -crop "$((width - 6))x16+$((wide_left + 1))+$((wy + 28))" +repage wide-field.png
differing=$(pixels_differing narrow-field.png wide-field.png)
[ "$differing" = 0 ] || fail "the narrow end field does not show the start of 132300 ($differing pixels differ from the wide field's start; see narrow-field.png, wide-field.png)"
quit_app
