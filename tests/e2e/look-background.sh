#!/bin/bash
# The window's background is the views' grey (216,216,216) everywhere the
# controls and views leave it showing: the control row, the band around the
# channel container and the gap between the row and the container.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

launch_stereo
read -r vx vy vw vh <<<"$(state_field '.channels[0].view | @tsv')"
read -r _ v1y _ _ <<<"$(state_field '.channels[1].view | @tsv')"
eval "$(xdotool getwindowgeometry --shell "$window")"
# The centres of two transport buttons, in window coordinates.
read -r stop_x stop_y <<<"$(state_field '.buttons.stop | @tsv')"
read -r mode_x mode_y <<<"$(state_field '.buttons["play mode"] | @tsv')"
stop_x=$((stop_x - wx)) stop_y=$((stop_y - wy))
mode_x=$((mode_x - wx)) mode_y=$((mode_y - wy))
grey="216,216,216"
# Drawn already: channel 0's frame.
await_pixel background.png $((wx + vx - 1)) $((wy + vy + vh / 2)) "152,152,152" "the frame of channel 0"
# The row's free width may all go to the controls; the gap between the range
# fields starts right of the start field, the second to last white run
# across the fields.
read -r _ start_right <<<"$(white_runs background.png $((wy + 27)) | tail -2 | head -1)"
[ -n "$start_right" ] || fail "no range fields in background.png"
between=$((start_right + 6 - wx))
# (x y what) in window coordinates.
while read -r x y what; do
    expect_pixel background.png $((wx + x)) $((wy + y)) "$grey" "$what"
done <<EOT
$((stop_x + 18)) $stop_y the control row between the stop button and the play mode popup
$((mode_x - 25)) $mode_y the control row between the play button and the play mode button
$between 35 the control row between the two range fields
$between 27 the control row above the gap between the range fields
3 $((vy + vh / 2)) the band left of the container
$((vx + vw + 3)) $((vy + vh / 2)) the band right of the container
$((vx + vw / 2)) $((vy - 4)) the gap between the control row and the container
$((vx + vw / 2)) $((HEIGHT - 3)) the band below the container
EOT
quit_app
