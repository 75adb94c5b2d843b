#!/bin/bash
# Clicks and double clicks in the sample views of a real window.
#
#   mouse-click.sh GLIMMET WORKDIR
#
# The file has 64 frames per view column: column c holds the frames
# 64c .. 64c + 63, and a click there puts the cursor on the middle frame,
# 64c + 31. Double clicks are two presses 120 ms apart; the double-click
# interval is Qt's default of 400 ms.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/mouse.sh"
e2e_begin "$@"

per_column=64
launch_columns_file clicks.wav "$per_column"

# A click selects nothing, focuses the clicked channel and puts the cursor
# on the frame under the pointer: the first and the last column, one inside
# and one in the other channel.
click_puts_cursor() {
    local channel column expected focus
    for place in "0 0" "0 101" "0 $((width - 1))" "1 250"; do
        read -r channel column <<<"$place"
        click_column "$channel" "$column"
        expected=$(frame_map frame "$column")
        [ "$expected" = $((per_column * column + per_column / 2 - 1)) ] \
            || fail "the mapping puts column $column at frame $expected"
        [ "$channel" = 0 ] && focus="true,false" || focus="false,true"
        expect_soon '[.cursor, .range[], (.channels[] | .focused), (.channels[] | .selected)] | @csv' \
            "$expected,-1,-1,$focus,false,false" \
            "cursor, range, focus and selection after a click at column $column of channel $channel"
    done
}

# Fails unless channel $1 alone is selected, whole: the range is its own
# frames and the cursor is on its first.
expect_channel_selected() {
    local selected="false,true"
    [ "$1" = 0 ] && selected="true,false"
    expect_soon '[.range[], .cursor, (.channels[] | .selected)] | @csv' "0,$((frames - 1)),0,$selected" \
        "range, cursor and selection after $2"
}

double_click_same_spot() {
    double_click_column 1 300
    expect_channel_selected 1 "a double click on one spot of channel 1"
}

double_click_apart() {
    double_click_column 0 200 6
    expect_channel_selected 0 "two clicks 6 px apart in channel 0"
}

# After a double click the cursor is on frame 0, drawn in column 0 of every
# channel; nothing else is blue.
double_click_draws_cursor() {
    double_click_column 1 400 6
    expect_channel_selected 1 "two clicks 6 px apart in channel 1"
    expect_cursor_columns double-click-cursor.png "0" "the cursor on frame 0 after a double click"
}

# Two clicks farther apart in time than the double-click interval are two
# plain clicks: nothing selected, the cursor where the second one was.
slow_clicks() {
    click_column 0 300
    sleep 0.9
    click_at $(spot 0 306)
    expect_soon '[.cursor, .range[], (.channels[] | .selected)] | @csv' "$(frame_map frame 306),-1,-1,false,false" \
        "cursor, range and selection after the second of two slow clicks"
}

run_case click_puts_cursor
run_case double_click_same_spot
run_case double_click_apart
run_case double_click_draws_cursor
run_case slow_clicks
finish_cases
