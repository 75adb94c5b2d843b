#!/bin/bash
# A file opened into a window that held another document starts with an
# empty history: undo has nothing of the earlier document's to undo.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo a.wav
sox -n -r 44100 -c 2 -b 16 b.wav synth 1 sine 700 sine 900 vol 0.4
printf 'open %s\nsaveas %s\nprint\n' "$PWD/b.wav" "$PWD/b-batch.wav" | batch >b-state.txt
b_frames=$(jq -r '.frames' b-state.txt)

launch a.wav
drag_range 0 0.2 0.6
menu_pick "$MENU_TOOLS" 1
expect_state '.undo' "Fade Out" "Tools > Fade Out"

note "File > Open… b.wav into the same window"
menu_pick "$MENU_FILE" 1
choose_in_panel "Select A Sound File" "$PWD/b.wav"
expect_state '[.title, .frames]' "[\"Glimmet - b.wav\",$b_frames]" "b.wav opens into the window"
[ "$(window_count)" = 1 ] || fail "b.wav opened another window"
reactivate
expect_state '[.undo, .redo, .saved]' '[null,null,true]' "the opened file's history is empty"

note "Ctrl+Z does nothing to b.wav"
xdotool key ctrl+z
settle
expect_state '[.frames, .undo, .redo, .saved]' "[$b_frames,null,null,true]" "Ctrl+Z after opening b.wav"
xdotool key ctrl+shift+s
choose_in_panel "Save As" "$PWD/b-gui.wav"
await_file b-gui.wav
cmp b-gui.wav b-batch.wav || fail "b.wav's samples changed after Ctrl+Z"
quit_app
