#!/bin/bash
# The keys of a focused sample view and the play controls of the control row:
# Space, Shift+Space, a Space repeated too soon, Ctrl+Space, Delete, the
# arrows, the play-mode popup and the "Loop" box.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

launch_stereo

note "Space starts and stops playing"
focus_channel 0 0.5
xdotool key space
expect_state '.playing' true "Space starts playing"
sleep 0.1
xdotool key space
expect_state '.playing' false "a second Space stops playing"

note "Ctrl+Space toggles playing too"
xdotool key ctrl+space
expect_state '.playing' true "Ctrl+Space starts playing"
sleep 0.1
xdotool key ctrl+space
expect_state '.playing' false "Ctrl+Space stops playing"

note "Shift+Space plays from the cursor"
cursor=$(state_field '.cursor')
[ "$cursor" -gt 30000 ] || fail "the click put the cursor at $cursor"
xdotool key shift+space
line=$(state_line)
[ "$(jq -r '.playing' <<<"$line")" = true ] || line=$(state_line)
[ "$(jq -r '.playing' <<<"$line")" = true ] || fail "Shift+Space did not start playing"
mark=$(jq -r '.playmark' <<<"$line")
# The mark starts at the cursor and moves on from there (less than a
# second's worth of frames by the time the state is read).
[ "$mark" -ge "$cursor" ] && [ "$mark" -lt $((cursor + 44100)) ] \
    || fail "playing from the cursor ($cursor) put the play mark at $mark"
xdotool key space
expect_state '.playing' false "Space stops playing from the cursor"

note "a second Space within 15 ms is not acted on"
# Both presses reach the view in one go, well within 15 ms of each other;
# a machine busy enough to hold the second one back for longer gets
# another try.
once=false
for attempt in 1 2 3; do
    before=$(state_field '.playing')
    xdotool key --delay 0 space space
    settle 0.5
    after=$(state_field '.playing')
    if [ "$after" != "$before" ]; then
        once=true
        break
    fi
    note "attempt $attempt: playing went back to $after"
done
$once || fail "two Spaces 0 ms apart toggled playing twice, three times over"
if [ "$(state_field '.playing')" = true ]; then
    xdotool key space
    expect_state '.playing' false "Space stops playing"
fi

note "Delete removes the selected range"
drag_range 0 0.2 0.4
read -r start end frames <<<"$(state_field '[.range[0], .range[1], .channels[0].frames] | @tsv')"
xdotool key Delete
expect_state '.channels[0].frames' $((frames - (end - start + 1))) "Delete removes $start..$end from channel 0"
expect_state '.undo' "Remove" "the undo item names the removal"
expect_state '.channels[1].frames' "$frames" "channel 1 was not selected and keeps its frames"

note "the arrow keys are swallowed"
drag_range 0 0.5 0.7
before=$(state_field '[.cursor, .range, .display, .channels[0].focused, .undo]')
xdotool key Left Right Up Down shift+Left ctrl+Right
settle
after=$(state_field '[.cursor, .range, .display, .channels[0].focused, .undo]')
[ "$after" = "$before" ] || fail "the arrow keys changed [cursor, range, display, focus, undo] from $before to $after"

note "the play-mode popup"
# The popup sits right of the transport buttons and the "Play" label, the
# box right of the popup.
click_at $((wx + 200)) $((wy + 35))
sleep 0.4
xdotool key Down Return
expect_state '.playmode' range "Range chosen from the open popup"
xdotool key Down
expect_state '.playmode' visible "Down on the focused popup"
click_at $((wx + 200)) $((wy + 35))
sleep 0.4
xdotool key Up Up Return
expect_state '.playmode' all "All chosen from the open popup"

note "the Loop box"
click_at $((wx + 243)) $((wy + 35))
expect_state '.loop' false "a click clears Loop"
click_at $((wx + 243)) $((wy + 35))
expect_state '.loop' true "a second click sets Loop again"

quit_app
