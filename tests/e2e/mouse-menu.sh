#!/bin/bash
# The channel context menu of a real window, opened with the secondary
# button: "Mute", "Left", "Middle", "Right" and "Remove", chosen with the
# mouse, and the marks the menu shows.
#
#   mouse-menu.sh GLIMMET WORKDIR
#
# The menu's items are found once in a screenshot by their text (see
# menu_items); the indicator column left of the text holds Qt's check boxes
# or radio dots.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/mouse.sh"
e2e_begin "$@"

make_stereo menu.wav 1
launch menu.wav
load_layout

# The items in their order, as menu_items lists them.
item_names=(Mute Left Middle Right Remove)

# Opens the menu of channel $1 with a click of the secondary button in
# column 300 and sets $menu_x and $menu_y to its top left corner.
open_menu() {
    pause_clicks
    click_at $(spot "$1" 300) 3
    read -r menu_x menu_y <<<"$(await_menu)"
}

# Reads the open menu's items from screenshot $1 into $menu (one
# "Y X MARKS" line each, see menu_items); tells whether all were found.
menu_read() {
    screenshot "$1"
    menu=$(menu_items "$1" "$menu_x" "$menu_y")
    [ "$(wc -l <<<"$menu")" = "${#item_names[@]}" ]
}

# Reads the open menu as menu_read does, taking the screenshot again while
# the menu is still being drawn, for up to three seconds.
read_menu() {
    retry_for 3 menu_read "$1" || fail "$1: the menu's items are not ${item_names[*]} (read: $(tr '\n' ';' <<<"$menu"))"
}

# The names of the marked items among "Left", "Middle" and "Right" of $menu.
marked_pans() {
    sed -n 2,4p <<<"$menu" \
        | awk 'BEGIN { split("Left Middle Right", n, " ") } $3 > 0 { printf "%s%s", out ? " " : "", n[NR]; out = 1 }'
}

# Reads the open menu from screenshot $1 and tells whether its only marked
# pan item is $2; sets $marked to the marked ones.
pan_marked_is() {
    menu_read "$1" && marked=$(marked_pans) && [ "$marked" = "$2" ]
}

# Where the items are in any menu: their offsets from its top left corner.
open_menu 0
read_menu menu.png
item_offsets=$(awk -v x="$menu_x" -v y="$menu_y" '{ print $1 - y, $2 - x + 10 }' <<<"$menu")
xdotool key Escape
await_no_menu

# Opens channel $1's menu and clicks its item named $2.
choose() {
    local index dy dx
    for index in "${!item_names[@]}"; do
        [ "${item_names[$index]}" = "$2" ] && break
    done
    read -r dy dx <<<"$(sed -n "$((index + 1))p" <<<"$item_offsets")"
    open_menu "$1"
    xdotool mousemove --sync $((menu_x + dx)) $((menu_y + dy)) sleep 0.1 click 1
    await_no_menu
}

mute() {
    choose 0 Mute
    expect_soon '[.channels[].muted] | @csv' "true,false" "muted channels after choosing Mute in channel 0's menu"
    choose 0 Mute
    expect_soon '[.channels[].muted] | @csv' "false,false" "muted channels after choosing Mute again"
}

pan() {
    local name value
    for choice in "Left -128" "Middle 0" "Right 127" "Left -128"; do
        read -r name value <<<"$choice"
        choose 1 "$name"
        expect_soon '.channels[1].pan' "$value" "channel 1's pan after choosing $name"
    done
}

# Of "Left", "Middle" and "Right" exactly one is marked, the channel's
# current pan: they are one group of choices.
one_pan_marked() {
    local name marked=""
    for name in Middle Right; do
        choose 0 "$name"
        expect_soon '.channels[0].pan' "$([ "$name" = Middle ] && echo 0 || echo 127)" "channel 0's pan after choosing $name"
        open_menu 0
        retry_for 3 pan_marked_is "marks-$name.png" "$name" || true
        xdotool key Escape
        await_no_menu
        [ "$marked" = "$name" ] || fail "marks-$name.png: marked are '$marked', expected only '$name'" \
            "(pixels left of the text: $(sed -n 2,4p <<<"$menu" | awk '{ printf "%s ", $3 }'))"
    done
}

remove() {
    choose 1 Remove
    expect_soon '.channels | length' 1 "channels after choosing Remove in channel 1's menu"
}

run_case mute
run_case pan
run_case one_pan_marked
run_case remove
finish_cases
