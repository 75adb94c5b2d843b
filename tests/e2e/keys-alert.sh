#!/bin/bash
# The three answers to "Save changes?" when an edited window is closed:
# "Yes, please." saves and closes, "Nope!" closes without saving, and the
# default "Don't quit!" keeps the window open and unsaved.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav

# Opens a copy of in.wav named $1, fades it in whole and asks to close the
# window; waits for the alert to take the focus.
edit_and_close() {
    cp in.wav "$1"
    launch "$1"
    xdotool key ctrl+a ctrl+i
    expect_state '[.undo, .saved]' '["Fade In",false]' "Ctrl+A Ctrl+I fades $1 in"
    xdotool key ctrl+w
    await_alert "$1"
}

note "Yes, please."
cp in.wav batch.wav
printf 'open %s\nSALL\nfdin\nanswer yes\n_QRQ\n' "$PWD/batch.wav" | batch >/dev/null
cmp -s batch.wav in.wav && fail "the batch mode's answer saved nothing"
edit_and_close yes.wav
screenshot alert.png
# The buttons run "Nope!", "Yes, please.", "Don't quit!"; the last has the
# focus.
xdotool key shift+Tab space
await_exit "after \"Yes, please.\""
cmp yes.wav batch.wav || fail "\"Yes, please.\" saved a file other than the batch mode's"

note "Nope!"
edit_and_close nope.wav
xdotool key shift+Tab shift+Tab space
await_exit "after \"Nope!\""
cmp nope.wav in.wav || fail "\"Nope!\" changed the file"

note "Don't quit!"
edit_and_close stay.wav
xdotool key Return
settle
expect_state '[.title, .undo, .saved]' '["Glimmet - stay.wav","Fade In",false]' "\"Don't quit!\" keeps the window as it was"
kill -0 "$app" || fail "the editor ended after \"Don't quit!\""
cmp stay.wav in.wav || fail "\"Don't quit!\" changed the file"
quit_app
