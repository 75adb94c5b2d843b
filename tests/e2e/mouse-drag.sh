#!/bin/bash
# Range drags across channels and Shift-clicks in a real window.
#
#   mouse-drag.sh GLIMMET WORKDIR
#
# The press anchors the range at the first frame of the pressed column;
# while the button is held the pointer is mapped at its view x + 2
# (container coordinates plus one), a Shift-click at its own x. The file is
# two seconds long, so a column holds a fraction of frames more than a
# whole number and the range's ends are where rounding decides (frame_map
# rounds as the views do).
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/mouse.sh"
e2e_begin "$@"

make_stereo drags.wav 2
frames=88200
launch drags.wav
load_layout

# Fails unless the range and the channels' selection are $1 ("START,END")
# and $2 ("true,false" ...).
expect_range() {
    expect_soon '[.range[], (.channels[] | .selected)] | @csv' "$1,$2" "range and selection after $3"
}

drag_across_channels() {
    drag_from 0 100 $(spot 1 300)
    expect_range "$(frame_map first 100 last 302)" "true,true" "a drag from channel 0 to 1"
    expect_soon '.cursor' "$(frame_map frame 100)" "cursor after a drag"
    drag_from 1 300 $(spot 0 100)
    expect_range "$(frame_map first 102 first 300)" "true,true" "a drag from channel 1 back to 0"
}

drag_past_the_start() {
    drag_from 0 200 $(spot 0 -40)
    expect_range "0,$(frame_map first 200)" "true,false" "a drag left past the view"
}

# The end is the frame count itself, one past the last frame.
# The drag asks for the frame count itself as the end; the document keeps
# its range inside the data and ends it on the last frame.
drag_past_the_end() {
    drag_from 1 200 $(spot 1 $((MAP_WIDTH + 40)))
    expect_range "$(frame_map first 200),$((frames - 1))" "false,true" "a drag right past the view"
}

drag_above_the_first_channel() {
    drag_from 1 200 $(spot 0 400 -40)
    expect_range "$(frame_map first 200 last 402)" "true,true" "a drag from channel 1 to above channel 0"
}

# The zoom slider is the strip right under the last view.
drag_into_the_zoom_slider() {
    drag_from 0 200 $(spot 1 400 $((VIEW_H[1] + 8)))
    expect_range "$(frame_map first 200 last 402)" "true,true" "a drag from channel 0 into the zoom slider"
}

# Shift-clicks column $2 of channel $1.
shift_click() {
    pause_clicks
    xdotool mousemove --sync $(spot "$1" "$2") keydown shift click 1 keyup shift
}

# Right of the range's middle the start stays; left of it the end stays.
# Either way the cursor goes to the end that stays, and the clicked channel
# alone is selected.
shift_extends_range() {
    drag_from 0 200 $(spot 1 298)
    expect_range "$(frame_map first 200 last 300)" "true,true" "a drag over columns 200 to 300"
    shift_click 0 400
    expect_soon '[.range[], .cursor, (.channels[] | .selected)] | @csv' \
        "$(frame_map first 200 last 400 first 200),true,false" "range, cursor and selection after a Shift-click right of the range"
    shift_click 0 150
    expect_soon '[.range[], .cursor, (.channels[] | .selected)] | @csv' \
        "$(frame_map first 150 last 400 last 400),true,false" "range, cursor and selection after a Shift-click left of the middle"
}

shift_extends_from_cursor() {
    click_column 1 300
    expect_soon '[.cursor, .range[]] | @csv' "$(frame_map frame 300),-1,-1" "a click at column 300"
    shift_click 1 250
    expect_range "$(frame_map first 250 frame 300)" "false,true" "a Shift-click left of the cursor"
}

# A plain click after a Shift-click leaves one cursor column: the new one.
# The Shift-click right of the range puts the cursor on the range's first
# frame, the first of its column, and deselects channel 1, which keeps
# showing the cursor there until the click moves it.
click_after_shift_click() {
    drag_from 0 200 $(spot 1 298)
    shift_click 0 400
    expect_soon '[.cursor, (.channels[] | .selected)] | @csv' "$(frame_map first 200),true,false" \
        "cursor and selection after a Shift-click right of the range"
    click_column 0 500
    expect_soon '[.cursor, .range[]] | @csv' "$(frame_map frame 500),-1,-1" "a click at column 500"
    expect_cursor_columns click-after-shift-click.png "$(frame_map column "$(frame_map frame 500)")" \
        "the cursor column after a click"
}

run_case drag_across_channels
run_case drag_past_the_start
run_case drag_past_the_end
run_case drag_above_the_first_channel
run_case drag_into_the_zoom_slider
run_case shift_extends_range
run_case shift_extends_from_cursor
run_case click_after_shift_click
finish_cases
