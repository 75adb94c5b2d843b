#!/bin/bash
# The transport buttons with the real mouse: a click on the play mode
# button starts playback, the play mark moves on and the button shows its
# playing picture; a click on stop ends playback and puts the mark back at
# the beginning; the play button starts from the beginning again.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

# Long enough not to end while the case looks at it.
make_stereo in.wav 20
launch in.wav

# The centre of transport button $1 on the screen.
button_centre() {
    state_field ".buttons[\"$1\"] | @tsv"
}
read -r mode_x mode_y <<<"$(button_centre 'play mode')"
read -r stop_x stop_y <<<"$(button_centre stop)"
read -r play_x play_y <<<"$(button_centre play)"

# The three buttons cut out of screenshot $1 into $2, to look at.
crop_buttons() {
    convert "$1" -crop "125x21+$((play_x - 18))+$((play_y - 10))" +repage "$2"
}

note "the buttons as drawn: the play symbol while stopped"
# The middle of each face is its symbol's: the play triangle, the square.
await_pixel stopped.png "$mode_x" "$mode_y" "0,0,0" "the play mode button's play symbol"
expect_pixel stopped.png "$stop_x" "$stop_y" "0,0,0" "the stop button's square"
expect_state '.transport' '{"play mode":1,"play":0,"enabled":true}' "the buttons start stopped and forward"
crop_buttons stopped.png buttons-stopped.png

note "a click on the play mode button starts playback"
click_at "$mode_x" "$mode_y"
expect_state '.playing' true "a click on the play mode button starts playback"
expect_state '.transport["play mode"]' 0 "the play mode button is in its playing mode"
# Playing, the button offers to pause: the middle of its face lies
# between the two bars.
await_pixel playing.png "$mode_x" "$mode_y" "232,232,232" "the gap between the pause bars"
expect_pixel playing.png $((mode_x - 3)) "$mode_y" "0,0,0" "the left pause bar"
crop_buttons playing.png buttons-playing.png

note "the play mark moves"
first=$(state_field '.playmark')
moved=false
for _ in $(seq 30); do
    sleep 0.1
    now=$(state_field '.playmark')
    if [ "$now" -gt "$first" ]; then
        moved=true
        break
    fi
done
$moved || fail "the play mark stayed at $first while playing"

note "a click on stop stops playback"
# Held down, the stop button shows its pushed picture.
pointer_to "$stop_x" "$stop_y"
xdotool mousedown 1
await_pixel stop-held.png $((stop_x - 14)) $((stop_y - 9)) "152,152,152" "the pushed stop button's shadow"
crop_buttons stop-held.png buttons-stop-pushed.png
xdotool mouseup 1
expect_state '.playing' false "a click on stop ends playback"
expect_state '.transport["play mode"]' 1 "the play mode button is back in its stopped mode"
expect_state '.playmark' 0 "stop puts the play mark back at the beginning"
await_pixel stopped-again.png "$mode_x" "$mode_y" "0,0,0" "the play symbol again"

note "a press on the play mode button and a release outside do nothing"
pointer_to "$mode_x" "$mode_y"
xdotool mousedown 1
sleep 0.1
xdotool mousemove --sync "$mode_x" $((mode_y + 60))
xdotool mouseup 1
settle
[ "$(state_field '[.playing, .transport["play mode"]] | @csv')" = "false,1" ] \
    || fail "a release outside the play mode button changed playback"

note "the play button plays from the beginning"
click_at "$play_x" "$play_y"
expect_state '.playing' true "a click on the play button starts playback"
expect_state '.transport["play mode"]' 0 "the play mode button follows"
click_at "$mode_x" "$mode_y"
expect_state '.playing' false "the play mode button pauses again"

quit_app
