#!/bin/bash
# Bubble help in a real window: nothing while it is off; switched on from
# Help > Bubble Help, a bubble with the widget's text appears when the
# pointer rests on the widget, pale yellow, 20 pixels below the pointer, and
# goes when the pointer moves; switched off again, no bubble.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

# The widget the pointer rests on (see widget_point) and the text its
# bubble shows.
HELP_WIDGET=stop
HELP_TEXT="Immediatly stops playback"

MENU_HELP=5
# "Bubble Help" among the Help menu's items (Index, Send Feedback, Bubble Help).
BUBBLE_HELP_ITEM=2

# A point of widget $1 on the screen, "X Y".
widget_point() {
    local wx wy
    read -r wx wy <<<"$(window_box)"
    case "$1" in
        # The popup sits right of the "Play" label.
        play-popup) echo "$((wx + 200)) $((wy + 35))" ;;
        stop) state_field '.buttons.stop | @tsv' ;;
        channel-view) view_point 0 0.5 0.5 ;;
        *) fail "no place known for widget '$1'" ;;
    esac
}

# The id of the visible bubble showing $HELP_TEXT (its window's name is the
# text it shows), or nothing.
bubble_window() {
    local id
    for id in $(xdotool search --onlyvisible --name '.' 2>/dev/null || true); do
        if [ "$(xdotool getwindowname "$id" 2>/dev/null)" = "$HELP_TEXT" ]; then
            echo "$id"
            return 0
        fi
    done
}

# Waits up to $1 milliseconds for the bubble; true when it is there.
await_bubble() {
    local deadline=$(($(date +%s%N) + $1 * 1000000))
    while [ "$(date +%s%N)" -lt "$deadline" ]; do
        [ -n "$(bubble_window)" ] && return 0
        sleep 0.05
    done
    return 1
}

# Waits up to $1 milliseconds for the bubble to go; true when it has.
await_no_bubble() {
    local deadline=$(($(date +%s%N) + $1 * 1000000))
    while [ "$(date +%s%N)" -lt "$deadline" ]; do
        [ -z "$(bubble_window)" ] && return 0
        sleep 0.05
    done
    return 1
}

toggle_bubble_help() {
    menu_pick "$MENU_HELP" "$BUBBLE_HELP_ITEM"
    settle 0.3
}

make_stereo help.wav 1
launch help.wav
read -r px py <<<"$(widget_point "$HELP_WIDGET")"

note "bubble help is off at start: resting on the $HELP_WIDGET shows nothing"
pointer_to "$px" "$py"
settle 1.5
[ -z "$(bubble_window)" ] || fail "a bubble appeared with bubble help off"

note "switched on, a rest on the $HELP_WIDGET shows its bubble"
toggle_bubble_help
started=$(date +%s%N)
pointer_to "$px" "$py"
await_bubble 4000 || fail "no bubble with '$HELP_TEXT' appeared within 4 s of resting on the $HELP_WIDGET"
waited=$((($(date +%s%N) - started) / 1000000))
# Seven polls 100 ms apart; a bubble after less than half a second would
# not have waited for the pointer to rest.
[ "$waited" -ge 500 ] || fail "the bubble appeared after $waited ms, before the pointer had rested"
note "the bubble appeared after $waited ms"
bubble=$(bubble_window)
eval "$(xdotool getwindowgeometry --shell "$bubble")"
[ "$X" = "$px" ] && [ "$Y" = $((py + 20)) ] || fail "the bubble is at ($X, $Y), expected ($px, $((py + 20)))"
screenshot bubble.png
expect_pixel bubble.png $((X + 1)) $((Y + 1)) "240,240,100" "the bubble's top left"
expect_pixel bubble.png $((X + 1)) $((Y + HEIGHT - 2)) "240,240,100" "the bubble's bottom left"
dark=$(convert bubble.png -crop "${WIDTH}x${HEIGHT}+$X+$Y" +repage -fill white -fuzz 0% +opaque black \
    -format '%[fx:round((1 - mean) * w * h)]' info:)
[ "$dark" -gt 0 ] || fail "the bubble shows no black text (bubble.png)"

note "a one-pixel move hides it at once"
xdotool mousemove_relative 1 0
# The next poll sees the move; the time allowed is for looking on a busy
# machine. The bubble would otherwise stay for 5 s (52 characters).
await_no_bubble 1500 || fail "the bubble stayed after the pointer moved"
screenshot moved.png

note "a new rest shows it again"
await_bubble 4000 || fail "no bubble after resting again"
xdotool mousemove_relative -- -1 0
await_no_bubble 1500 || fail "the bubble stayed after the pointer moved back"

note "switched off, resting shows nothing"
toggle_bubble_help
pointer_to "$px" "$py"
xdotool mousemove_relative 0 1
settle 1.5
[ -z "$(bubble_window)" ] || fail "a bubble appeared after bubble help was switched off"

quit_app
