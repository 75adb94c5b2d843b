#!/bin/bash
# Two windows play at the same time, also when the output allows a single
# device (SDL's dummy driver).
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo a.wav
make_stereo b.wav 1
launch a.wav
first=$window

note "a second window, b.wav opened into it"
xdotool key ctrl+n
second=$(wait_window '^Glimmet$')
expect_state '.active' true "the new window is active" 1
menu_pick "$MENU_FILE" 1 1
choose_in_panel "Select A Sound File" "$PWD/b.wav"
expect_state '[.title, .frames]' '["Glimmet - b.wav",44100]' "b.wav opens into the second window" 1

note "both play"
reactivate 0 "$first"
xdotool key ctrl+space
expect_state '.playing' true "the first window plays" 0
reactivate 1 "$second"
xdotool key ctrl+space
expect_state '.playing' true "the second window plays" 1
expect_state '.playing' true "the first window plays on" 0
expect_no_log "Error setting up nodes" "the second window could not set up its output"
quit_app
