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
grey="216,216,216"
# Drawn already: channel 0's frame.
await_pixel background.png $((wx + vx - 1)) $((wy + vy + vh / 2)) "152,152,152" "the frame of channel 0"
# (x y what) in window coordinates.
while read -r x y what; do
    expect_pixel background.png $((wx + x)) $((wy + y)) "$grey" "$what"
done <<EOT
$((vx + vw / 4)) 35 the control row between the Loop box and the range start label
$((vx + vw - 210)) 35 the control row between the two range fields
$((vx + vw - 210)) 27 the control row above the gap between the range fields
3 $((vy + vh / 2)) the band left of the container
$((vx + vw + 3)) $((vy + vh / 2)) the band right of the container
$((vx + vw / 2)) $((vy - 4)) the gap between the control row and the container
$((vx + vw / 2)) $((HEIGHT - 3)) the band below the container
EOT
quit_app
