#!/bin/bash
# Moving channels in time with the middle button and with Ctrl and the
# primary button in a real window, undoing the moves, and a double click on
# a moved channel.
#
#   mouse-move.sh GLIMMET WORKDIR
#
# The file has 64 frames per view column (see mouse-click.sh). A move grabs
# the frame under the press (in view coordinates) and follows the pointer
# in container coordinates, one column right of the view's own.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/mouse.sh"
e2e_begin "$@"

launch_columns_file moves.wav 64

# Drags channel $1 from column $2 to column $3 with button $4 while key $5
# (or none) is held, and checks that it moved by the frames between the two
# columns, that the window offers to undo the move and that Ctrl+Z puts the
# channel back.
move_and_undo() {
    local channel=$1 from=$2 to=$3 distance other=$((1 - $1))
    load_layout
    distance=$(($(frame_map first $((to + 1))) - $(frame_map first "$from")))
    drag_from "$channel" "$from" $(spot "$channel" "$to") "$4" "${5:-}"
    expect_soon "[.channels[$channel].first, .channels[$other].first, .frames, .undo] | @csv" \
        "$distance,0,$((frames + distance)),\"Move Sample\"" \
        "first frames of channel $channel and $other, length and undo item after the move"
    xdotool key ctrl+z
    expect_soon "[.channels[$channel].first, .frames, .undo, .redo] | @csv" "0,$frames,,\"Move Sample\"" \
        "first frame of channel $channel, length and history after undoing the move"
}

middle_button_moves() {
    move_and_undo 1 100 150 2
}

ctrl_primary_button_moves() {
    move_and_undo 0 300 340 1 ctrl
}

# A moved channel's own frames start later: a double click selects them and
# puts the cursor on their first frame, which both channels draw.
double_click_on_moved_channel() {
    local first column
    load_layout
    first=$(($(frame_map first 200) - $(frame_map first 100)))
    drag_from 1 100 $(spot 1 199) 2
    expect_soon '.channels[1].first' "$first" "first frame of channel 1 after the move"
    load_layout
    column=$(frame_map column "$first")
    double_click_column 1 400 6
    expect_soon '[.range[], .cursor, (.channels[] | .selected)] | @csv' \
        "$first,$((first + frames - 1)),$first,false,true" \
        "range, cursor and selection after a double click on the moved channel"
    expect_cursor_columns double-click-moved.png "$column" "the cursor on the moved channel's first frame"
    # Left of it channel 1 has no frames: the plain empty colour, not the
    # range's.
    expect_pixel double-click-moved.png $(spot 1 $((column - 1)) 0) "80,80,80" "channel 1 before its first frame"
}

run_case middle_button_moves
run_case ctrl_primary_button_moves
run_case double_click_on_moved_channel
finish_cases
