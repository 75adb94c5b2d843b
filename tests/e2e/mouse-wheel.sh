#!/bin/bash
# The mouse wheel over the sample views of a real window: it scrolls and,
# with Ctrl, zooms, through the zoom slider.
#
#   mouse-wheel.sh GLIMMET WORKDIR
#
# A notch (X buttons 4 up, 5 down, 6 left, 7 right) scrolls by a tenth of
# the frames on display, down and right towards the end; Ctrl with a notch
# up shows 0.8 times the frames, around the frame under the pointer, and a
# notch down 1.25 times. The state's "slider" (the frames the slider's
# handles stand for) must end equal to "display".
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/mouse.sh"
e2e_begin "$@"

make_stereo wheel.wav 10
frames=441000
launch wheel.wav
load_layout

# Waits until the display range is no longer $1 ("FIRST,LAST") and the
# slider agrees with it, then reads the layout again.
await_display_change() {
    retry_for 5 display_moved "$1" || fail "$2: the display stayed at $1 (slider $got_slider)"
    load_layout
}
display_moved() {
    local line
    line=$(state | sed -n 1p)
    got=$(jq -r '.display | @csv' <<<"$line")
    got_slider=$(jq -r '.slider | @csv' <<<"$line")
    [ "$got" != "$1" ] && [ "$got" = "$got_slider" ]
}
display() {
    echo "$MAP_FIRST,$MAP_LAST"
}
span() {
    echo $((MAP_LAST - MAP_FIRST + 1))
}
# Fails unless $1 and $2 differ by at most $3.
expect_near() {
    local difference=$(($1 - $2))
    [ "${difference#-}" -le "$3" ] || fail "$4: $1, expected $2 within $3"
}
# Turns the wheel: X button $1, $2 notches (default 1), the pointer over
# column $3 of channel 0 (default 200), holding key $4 (default none).
wheel() {
    local key=${4:-}
    pointer_to $(spot 0 "${3:-200}")
    [ -z "$key" ] || xdotool keydown "$key"
    xdotool click --repeat "${2:-1}" --delay 60 "$1"
    [ -z "$key" ] || xdotool keyup "$key"
}

# Ctrl and a notch up keep the frame under the pointer in its column (the
# view's column 200 is the mapping's 201).
ctrl_wheel_zooms_around_the_pointer() {
    local before under old_span
    for column in 200 60; do
        before=$(display)
        old_span=$(span)
        under=$(frame_map frame $((column + 1)))
        wheel 4 1 "$column" ctrl
        await_display_change "$before" "Ctrl and a notch up at column $column"
        expect_near $(($(span) * 10)) $((old_span * 8)) 20 "frames on display after a notch of zoom, times ten"
        IFS=, read -r low high <<<"$(frame_map first "$column" last $((column + 2)))"
        [ "$low" -le "$under" ] && [ "$under" -le "$high" ] \
            || fail "frame $under left column $((column + 1)) ($low .. $high after the zoom)"
    done
}

wheel_scrolls_a_tenth() {
    local before first old_span
    load_layout
    before=$(display)
    first=$MAP_FIRST
    old_span=$(span)
    wheel 5
    await_display_change "$before" "a notch down"
    expect_near "$MAP_FIRST" $((first + old_span / 10)) 1 "the first frame after a notch down"
    expect_near "$(span)" "$old_span" 1 "the frames on display after a notch down"
    before=$(display)
    wheel 4
    await_display_change "$before" "a notch up"
    expect_near "$MAP_FIRST" "$first" 2 "the first frame after a notch down and up"
    before=$(display)
    wheel 7
    await_display_change "$before" "a notch right"
    expect_near "$MAP_FIRST" $((first + old_span / 10)) 2 "the first frame after a notch right"
}

wheel_stops_at_the_start() {
    local old_span
    load_layout
    old_span=$(span)
    wheel 4 30
    expect_soon '[.display[0], .slider[0]] | @csv' "0,0" "the display after 30 notches up"
    load_layout
    expect_near "$(span)" "$old_span" 1 "the frames on display at the start"
    wheel 4 2
    settle
    expect_soon '[.display[0], .display[1] - .display[0] + 1, .slider[0]] | @csv' "0,$(span),0" \
        "the display after more notches up at the start"
}

wheel_stops_at_the_end() {
    wheel 5 60
    expect_soon '[.display[1], .slider[1]] | @csv' "$((frames - 1)),$((frames - 1))" \
        "the display after 60 notches down"
}

ctrl_wheel_zooms_out_to_the_whole_file() {
    wheel 5 30 300 ctrl
    expect_soon '[.display[], .slider[]] | @csv' "0,$((frames - 1)),0,$((frames - 1))" \
        "the display after 30 notches of zooming out"
}

run_case ctrl_wheel_zooms_around_the_pointer
run_case wheel_scrolls_a_tenth
run_case wheel_stops_at_the_start
run_case wheel_stops_at_the_end
run_case ctrl_wheel_zooms_out_to_the_whole_file
finish_cases
