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

per_column=64
width=$(view_width)
make_columns_file moves.wav "$per_column" 2 "$width"
frames=$((per_column * width))
launch moves.wav
load_mapping

# Drags channel $1 from column $2 to column $3 with button $4 while key $5
# (or none) is held, and checks that it moved by the frames between the two
# columns, that the window offers to undo the move and that Ctrl+Z puts the
# channel back.
move_and_undo() {
    local channel=$1 from=$2 to=$3 button=$4 key=${5:-}
    local x0 y0 x1 y1 distance other=$((1 - $1))
    distance=$(($(frame_map first $((to + 1))) - $(frame_map first "$from")))
    pause_clicks
    read -r x0 y0 <<<"$(spot "$channel" "$from")"
    read -r x1 y1 <<<"$(spot "$channel" "$to")"
    if [ -n "$key" ]; then
        drag_holding "$x0" "$y0" "$x1" "$y1" "$button" "$key"
    else
        drag "$x0" "$y0" "$x1" "$y1" "$button"
    fi
    expect_soon ".channels[$channel].first" "$distance" "first frame of channel $channel after the move"
    expect_soon ".channels[$other].first" 0 "first frame of the channel not moved"
    expect_soon '.frames' $((frames + distance)) "the document's length after the move"
    expect_soon '.undo' "Move Sample" "the undo item after the move"
    xdotool key ctrl+z
    expect_soon ".channels[$channel].first" 0 "first frame of channel $channel after undoing the move"
    expect_soon '[.frames, .undo, .redo] | @csv' "$frames,,\"Move Sample\"" "length and history after undoing the move"
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
    local x y first column
    pause_clicks
    read -r x y <<<"$(spot 1 100)"
    drag "$x" "$y" $(spot 1 199) 2
    first=$(($(frame_map first 200) - $(frame_map first 100)))
    expect_soon '.channels[1].first' "$first" "first frame of channel 1 after the move"
    pause_clicks
    read -r x y <<<"$(spot 1 400)"
    double_click_at "$x" "$y" 6
    expect_soon '[.range[], .cursor] | @csv' "$first,$((first + frames - 1)),$first" "range and cursor after a double click on the moved channel"
    expect_soon '[.channels[].selected] | @csv' "false,true" "selection after a double click on the moved channel"
    column=$((first / per_column))
    settled_screenshot double-click-moved.png
    expect_cursor_columns double-click-moved.png "$column" "the cursor on the moved channel's first frame"
    # Left of it channel 1 has no frames: the plain empty colour, not the
    # range's.
    read -r x y <<<"$(view_pixel 1 $((column - 1)) 0)"
    expect_pixel double-click-moved.png "$x" "$y" "80,80,80" "channel 1 before its first frame"
}

run_case middle_button_moves
run_case ctrl_primary_button_moves
run_case double_click_on_moved_channel
finish_cases
