# Helpers of the keyboard and widget cases, on top of lib.sh (source lib.sh
# first). Batch-mode runs compute what a step should have produced.

# The menu bar's menus, as menu_pick counts them.
MENU_FILE=0
MENU_EDIT=1
MENU_CHANNEL=2
MENU_TOOLS=3
MENU_VIEW=4

# The colour of a highlighted menu row.
MENU_HIGHLIGHT="48,140,198"

# Runs the batch-mode script on standard input; prints its "print" lines.
batch() {
    "$GLIMMET" --batch - >batch.out 2>>batch.log || fail "the batch mode failed: $(tail -3 batch.log)"
    grep '^{' batch.out || true
}

# Window $1's (default 0) whole state line, for reading several fields of
# one moment.
state_line() {
    state | sed -n "$((${1:-0} + 1))p"
}

# The number of document windows.
window_count() {
    state | grep -c '^{' || true
}

# Clicks channel $1's view at fraction $2 of its width (the cursor goes
# there) and waits until the view has the focus.
focus_channel() {
    local x y
    read -r x y <<<"$(view_point "$1" "${2:-0.5}" 0.5)"
    click_at "$x" "$y"
    expect_state ".channels[$1].focused" true "a click focuses channel $1"
}

# Drags across channel $1's view from fraction $2 to fraction $3 of its
# width and waits until a range is set.
drag_range() {
    local x0 y x1 _y
    read -r x0 y <<<"$(view_point "$1" "$2" 0.5)"
    read -r x1 _y <<<"$(view_point "$1" "$3" 0.5)"
    drag "$x0" "$y" "$x1" "$y"
    expect_state '.range[0] >= 0 and .range[1] > .range[0]' true "a drag sets a range"
}

# Opens the menu bar's menu $1 (MENU_*) and moves to its item $2 (counted
# from 0 over the items the keyboard visits) in window $3 (default 0),
# leaving the menu open.
menu_open_at() {
    local wx wy
    read -r wx wy <<<"$(window_box "${3:-0}")"
    click_at $((wx + 20)) $((wy + 8))
    sleep 0.3
    # A clicked menu has no item marked yet; moving to the next menu marks
    # that menu's first item.
    [ "$1" = 0 ] && xdotool key Down
    local i
    for ((i = 0; i < $1; i++)); do xdotool key Right; done
    for ((i = 0; i < $2; i++)); do xdotool key Down; done
    sleep 0.3
}

# Takes item $2 of menu $1 in window $3 (see menu_open_at).
menu_pick() {
    menu_open_at "$@"
    xdotool key Return
}

# Writes to $2 the shortcut text of the highlighted menu row in screenshot
# $1, trimmed to its ink, so that two rows' shortcuts compare pixel for
# pixel wherever their columns start.
menu_shortcut_crop() {
    local wy row w h x y
    read -r _ wy <<<"$(window_box)"
    # The marked menu title in the menu bar has the same colour; the rows
    # start below it.
    row=$(convert "$1" -crop "1024x600+0+$((wy + 22))" +repage \
        -fill black +opaque "rgb($MENU_HIGHLIGHT)" -fill white -opaque "rgb($MENU_HIGHLIGHT)" -format "%@" info:)
    [[ "$row" =~ ^([0-9]+)x([0-9]+)\+([0-9]+)\+([0-9]+)$ ]] || fail "no highlighted menu row in $1 ($row)"
    w=${BASH_REMATCH[1]} h=${BASH_REMATCH[2]} x=${BASH_REMATCH[3]} y=${BASH_REMATCH[4]}
    convert "$1" -crop "$((w / 2))x$((h - 2))+$((x + w / 2))+$((y + wy + 23))" +repage \
        -bordercolor "rgb($MENU_HIGHLIGHT)" -border 1 -trim +repage "$2"
}

# The number of pixels in which two pictures differ (fails on other sizes).
pixels_differing() {
    compare -metric AE "$1" "$2" null: 2>&1 || true
}

# Waits up to five seconds for a visible window named exactly $1; prints its
# id or nothing.
find_window() {
    local id=""
    for _ in $(seq 50); do
        id=$(xdotool search --onlyvisible --name "^$1\$" 2>/dev/null | head -1 || true)
        [ -n "$id" ] && break
        sleep 0.1
    done
    echo "$id"
}

# Chooses file $2 in the file panel named $1 ("Select A Sound File", "Save
# As") by typing its path.
choose_in_panel() {
    local panel
    panel=$(find_window "$1")
    [ -n "$panel" ] || fail "the panel \"$1\" did not appear"
    xdotool windowactivate --sync "$panel" 2>/dev/null || xdotool windowfocus --sync "$panel"
    sleep 0.3
    xdotool type --delay 5 "$2"
    if [ -e "$2" ]; then
        # A name that exists opens the name field's completion list, which
        # would outlive the panel and keep the window from becoming active;
        # Escape closes the list first.
        sleep 0.4
        xdotool key Escape
        sleep 0.1
    fi
    xdotool key Return
}

# Waits for file $1 to exist.
await_file() {
    for _ in $(seq 50); do
        [ -s "$1" ] && return 0
        sleep 0.1
    done
    fail "no file $1 was written"
}

# Fails if app.log has a line matching $1 ($2 says what it would mean).
expect_no_log() {
    if grep -q "$1" app.log; then
        fail "$2: $(grep -m1 "$1" app.log)"
    fi
}

# Types $2 into range field $1 (0 start, 1 end) and presses Enter.
type_range_field() {
    field_click "$1"
    xdotool key ctrl+a
    xdotool type --delay 5 -- "$2"
    xdotool key Return
}

# Clicks into range field $1 (0 start, 1 end), near its right end.
field_click() {
    local wx wy w
    read -r wx wy <<<"$(window_box)"
    w=$(state_field '.channels[0].view | .[0] + .[2]')
    if [ "$1" = 0 ]; then
        # The start field ends where the end field's label begins.
        click_at $((wx + w - 230)) $((wy + 35))
    else
        click_at $((wx + w - 10)) $((wy + 35))
    fi
    sleep 0.2
}

# The white boxes (the range fields) crossing row $2 of screenshot $1, one
# "LEFT RIGHT" line each, in screen pixels.
white_runs() {
    convert "$1" -crop "1024x1+0+$2" +repage -depth 8 txt:- | awk -F'[,: ]+' '
        /^[0-9]/ {
            white = ($0 ~ /#FFFFFF/)
            if (white && start < 0) start = $1
            if (!white && start >= 0) { if ($1 - start >= 15) print start, $1 - 1; start = -1 }
        }
        BEGIN { start = -1 }'
}

# Brings document window $1 (default 0; its X id in $2, default $window)
# back to the front after a panel closed, and waits until it is active.
reactivate() {
    xdotool windowactivate --sync "${2:-$window}" 2>/dev/null || xdotool windowfocus --sync "${2:-$window}"
    expect_state '.active' true "window ${1:-0} is active again" "${1:-0}"
}

# Waits for "Save changes?" to take the focus from window $window after a
# close was asked for ($1 says which).
await_alert() {
    for _ in $(seq 50); do
        [ "$(xdotool getactivewindow 2>/dev/null)" != "$window" ] && break
        sleep 0.1
    done
    [ "$(xdotool getactivewindow 2>/dev/null)" != "$window" ] || fail "closing $1 did not ask \"Save changes?\""
    sleep 0.3
}

# Opens a new stereo in.wav in the editor; sets wx, wy to the window's
# origin on the screen.
launch_stereo() {
    make_stereo in.wav
    launch in.wav
    read -r wx wy <<<"$(window_box)"
}
