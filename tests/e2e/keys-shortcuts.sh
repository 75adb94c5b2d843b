#!/bin/bash
# Every menu shortcut but the two shared ones does what its menu item does:
# the edits are done again through the batch mode, and the files and states
# compared.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav
launch in.wav

# A range across both channels, from a quarter of channel 0 to 0.6 of
# channel 1.
read -r x0 y0 <<<"$(view_point 0 0.25 0.5)"
read -r x1 y1 <<<"$(view_point 1 0.6 0.5)"
drag "$x0" "$y0" "$x1" "$y1"
expect_state '[.channels[].selected] | all' true "the drag selects both channels"
read -r start end cursor <<<"$(state_field '[.range[0], .range[1], .cursor] | @tsv')"
note "range $start..$end, cursor $cursor"

# The same steps through the batch mode, a state line after each.
{
    printf 'open %s\nrange %s %s\nselect 0 1\nfocus 0\ncursor %s\n' "$PWD/in.wav" "$start" "$end" "$cursor"
    printf 'fdin\nprint\nmaxi\nprint\nundo\nprint\nredo\nprint\nCOPY\nCCUT\nprint\nPSTE\nprint\n'
    printf 'zora\nprint\nshal\nprint\nfdot\nprint\nSALL\nprint\nsaveas %s\nprint\n' "$PWD/batch-first.wav"
    # Ctrl+S is done as another Save As, keeping the first file.
    printf 'fdin\nsaveas %s\nprint\nappend %s\nprint\n' "$PWD/batch.wav" "$PWD/in.wav"
} | batch | jq -c '[.frames, (.channels | length), .range, .display, .undo, .redo, .saved]' >expected.txt
[ "$(wc -l <expected.txt)" = 13 ] || fail "the batch mode printed $(wc -l <expected.txt) states"
step=0
# Compares the window's state with the batch mode's next one.
expect_step() {
    step=$((step + 1))
    expect_state '[.frames, (.channels | length), .range, .display, .undo, .redo, .saved]' "$(sed -n "${step}p" expected.txt)" "$1"
}

note "Ctrl+I, Ctrl+M, Ctrl+Z, Ctrl+Shift+Z"
xdotool key ctrl+i
expect_step "Ctrl+I fades in"
xdotool key ctrl+m
expect_step "Ctrl+M maximizes"
xdotool key ctrl+z
expect_step "Ctrl+Z undoes"
xdotool key ctrl+shift+z
expect_step "Ctrl+Shift+Z redoes"

note "Ctrl+C, Ctrl+X, Ctrl+V"
xdotool key ctrl+c
settle 0.2
xdotool key ctrl+x
expect_step "Ctrl+X cuts"
xdotool key ctrl+v
expect_step "Ctrl+V pastes what Ctrl+C copied"

note "Ctrl+R, View > Show All, Tools > Fade Out, Ctrl+A"
xdotool key ctrl+r
expect_step "Ctrl+R zooms to the range"
menu_pick "$MENU_VIEW" 1
expect_step "View > Show All"
menu_pick "$MENU_TOOLS" 1
expect_step "Tools > Fade Out"
xdotool key ctrl+a
expect_step "Ctrl+A selects all"

note "Ctrl+Shift+S saves as"
xdotool key ctrl+shift+s
choose_in_panel "Save As" "$PWD/gui.wav"
await_file gui.wav
expect_state '.title' "Glimmet - gui.wav" "the window takes the saved file's name"
reactivate
expect_step "Save As"
cmp gui.wav batch-first.wav || fail "the file saved through Ctrl+Shift+S differs from the batch mode's"
cmp -s gui.wav in.wav && fail "the edits changed nothing"

note "Ctrl+S saves a further edit"
cp gui.wav gui-before.wav
xdotool key ctrl+i
settle 0.2
xdotool key ctrl+s
expect_step "Ctrl+I, then Ctrl+S"
cmp gui.wav batch.wav || fail "the file saved through Ctrl+S differs from the batch mode's"
cmp -s gui.wav gui-before.wav && fail "Ctrl+S wrote nothing new"

note "Ctrl+Shift+O appends the channels of the file chosen"
xdotool key ctrl+shift+o
choose_in_panel "Select A Sound File" "$PWD/in.wav"
expect_step "Ctrl+Shift+O appends in.wav"
reactivate

note "Ctrl+N opens a window, Ctrl+H changes nothing, Ctrl+W closes, Ctrl+Q quits"
xdotool key ctrl+n
expect_state '.title' "Glimmet" "Ctrl+N opens an empty window" 1
[ "$(window_count)" = 2 ] || fail "Ctrl+N made $(window_count) windows"
wait_window '^Glimmet$' >/dev/null
expect_state '.active' true "the new window is active" 1
xdotool key ctrl+h
settle
[ "$(window_count)" = 2 ] || fail "Ctrl+H changed the windows"
xdotool key ctrl+w
for _ in $(seq 50); do
    [ "$(window_count)" = 1 ] && break
    sleep 0.1
done
[ "$(window_count)" = 1 ] || fail "Ctrl+W did not close the new window"
expect_state '.title' "Glimmet - gui.wav" "Ctrl+W closed the active window only"
xdotool key ctrl+n
wait_window '^Glimmet$' >/dev/null
expect_state '.active' true "the second new window is active" 1
xdotool key ctrl+q
await_exit "Ctrl+Q quits with two windows open"
cmp gui.wav batch.wav || fail "quitting changed the saved file"
cmp -s gui.wav gui-before.wav && fail "quitting undid the save"
note "every shortcut did what its item does"
