# Helpers of the mouse cases (mouse-*.sh), sourced after lib.sh.
#
# A mouse script is a list of cases run one after the other in the same
# window; each case is a shell function run by run_case in a subshell, so
# that one failing case is reported and the others still run. Cases start
# from a state they set up themselves or that the case before left.
#
# Every program started costs time on a loaded machine, so the window's
# layout is read once (load_layout) and places are computed from it in the
# shell.

MOUSE_FAILED=""
MOUSE_STARTED=$(date +%s%N)

# A command failing outside the checks ends the script or the case through
# `set -e` without a word; this says which one.
mouse_stopped() {
    echo "FAIL: stopped by a failing command: $1 (status $2, line $3)" >&2
}
MOUSE_ERR_TRAP='mouse_stopped "$BASH_COMMAND" "$?" "$LINENO"'
set -o errtrace
trap "$MOUSE_ERR_TRAP" ERR

# Tenths of a second since $1 (from date +%s%N), as "S.T s".
since() {
    local tenths=$((($(date +%s%N) - $1) / 100000000))
    echo "$((tenths / 10)).$((tenths % 10)) s"
}

# Runs case function $1 (named $1 in the report) with `set -e` in effect.
run_case() {
    local status=0 started
    started=$(date +%s%N)
    note "case $1"
    # The case's own failure is reported below, not as a failing command.
    set +e
    trap - ERR
    (
        trap "$MOUSE_ERR_TRAP" ERR
        set -e
        "$1"
    )
    status=$?
    trap "$MOUSE_ERR_TRAP" ERR
    set -e
    if [ "$status" = 0 ]; then
        note "case $1: ok ($(since "$started"))"
    else
        note "case $1: FAILED ($(since "$started"))"
        MOUSE_FAILED="$MOUSE_FAILED $1"
    fi
}

# Ends the script: fails when a case did, with the names of those cases.
finish_cases() {
    note "$(basename "$0"): $(since "$MOUSE_STARTED")"
    [ -z "$MOUSE_FAILED" ] || {
        echo "FAIL: cases failed:$MOUSE_FAILED" >&2
        exit 1
    }
}

# Runs command $2... again and again until it succeeds, for up to $1
# seconds; returns 1 when it never does. Bounded by the clock rather than by
# a number of tries: each try starts programs, slow on a loaded machine.
retry_for() {
    local deadline=$(($(date +%s%N) + $1 * 1000000000))
    shift
    until "$@"; do
        [ "$(date +%s%N)" -lt "$deadline" ] || return 1
        sleep 0.1
    done
}

# Whether `state_field $1` prints $2; sets $got to what it prints.
state_is() {
    got=$(state_field "$1" 2>/dev/null || true)
    [ "$got" = "$2" ]
}

# Like lib.sh's expect_state, bounded by the clock: waits up to $4 seconds
# (default 5) for `state_field EXPR` to print EXPECTED.
#   expect_soon EXPR EXPECTED WHAT [SECONDS]
expect_soon() {
    local got=""
    retry_for "${4:-5}" state_is "$1" "$2" || fail "$3: $1 is '$got', expected '$2'"
}

# --- Test files ------------------------------------------------------------

# The width in pixels of a sample view in a new window, as the batch mode
# lays it out (the same layout as a real window's).
view_width() {
    sox -r 44100 -n -r 44100 -c 1 -b 16 layout.wav synth 0.1 sine 300
    printf 'open %s\nprint\n' "$E2E_WORK/layout.wav" | QT_QPA_PLATFORM=offscreen "$GLIMMET" --batch - 2>/dev/null \
        | grep '^{' | jq -r '.channels[0].view[2]'
}

# A file of $3 channels holding exactly $2 frames per column of a $4 pixel
# wide view, so that every column starts on a whole frame and the frames
# under a pixel are easy to check by hand: column c holds the frames
# $2 * c .. $2 * c + $2 - 1. Tones at half scale: the top and bottom rows of
# every data column stay empty.
make_columns_file() {
    local file=$1 per_column=$2 channels=$3 width=$4
    local tones="sine 300 sine 500"
    [ "$channels" = 1 ] && tones="sine 400"
    # The rate is given for the generated input too, or it is made at
    # another rate and resampled to a different length.
    sox -r 44100 -n -r 44100 -c "$channels" -b 16 "$file" synth "$((per_column * width))s" $tones vol 0.5
}

# Makes file $1 (two channels) of $2 frames per column of a new window's
# sample views, opens it in the editor and reads the layout. Sets $width
# and $frames.
launch_columns_file() {
    width=$(view_width)
    frames=$(($2 * width))
    make_columns_file "$1" "$2" 2 "$width"
    launch "$1"
    load_layout
    [ "$MAP_WIDTH,$MAP_FIRST,$MAP_LAST" = "$width,0,$((frames - 1))" ] \
        || fail "the window shows frames $MAP_FIRST to $MAP_LAST in $MAP_WIDTH pixels, expected all $frames in $width"
}

# --- The layout and the frames under the pointer ----------------------------

# The interpreter itself rather than a launcher in front of it, which may
# take longer to start than the step it runs.
MOUSE_PYTHON=$(python3 -c 'import sys; print(sys.executable)')

# Reads where the window's sample views are on the screen (VIEW_X, VIEW_Y,
# VIEW_W, VIEW_H, one entry per channel), the view width and the displayed
# frames (MAP_WIDTH, MAP_FIRST, MAP_LAST, for frame_map). Run again when
# channels come or go or the display changes.
load_layout() {
    local line
    line=$(state | sed -n 1p)
    read -r MAP_WIDTH MAP_FIRST MAP_LAST <<<"$(jq -r '[.channels[0].view[2], .display[0], .display[1]] | @tsv' <<<"$line")"
    VIEW_X=() VIEW_Y=() VIEW_W=() VIEW_H=()
    while read -r x y w h; do
        VIEW_X+=("$x") VIEW_Y+=("$y") VIEW_W+=("$w") VIEW_H+=("$h")
    done < <(jq -r '.screen as $s | .channels[] | [$s[0] + .view[0], $s[1] + .view[1], .view[2], .view[3]] | @tsv' <<<"$line")
}

# The screen position of column $2 of channel $1's view, in row $3 (default
# half way down), as "X Y".
spot() {
    echo "$((VIEW_X[$1] + $2)) $((VIEW_Y[$1] + ${3:-$((VIEW_H[$1] / 2))}))"
}

# What FrameMapping gives for the layout read by load_layout, in single
# precision as it computes, for pairs of a question and a value:
#   frame_map first|last|frame COLUMN ... | pos|column FRAME ...
# "first", "last" and "frame" take a column (x in the mapping's
# coordinates), "pos" and "column" a frame ("column" is the one drawing it). The answers are printed comma separated.
# Sample views map clicks at their own x; a drag is mapped at the view's
# x + 2 (container coordinates plus one), a channel move at x + 1
# (container coordinates).
frame_map() {
    "$MOUSE_PYTHON" - "$MAP_WIDTH" "$MAP_FIRST" "$MAP_LAST" "$@" <<'EOF'
import math, struct, sys
width, first, last = (int(v) for v in sys.argv[1:4])
def f32(x):
    return struct.unpack('f', struct.pack('f', x))[0]
# The container's width: the view plus its one-pixel frame on both sides,
# less one (edges are inclusive).
mapping_width = f32(width + 1)
per_column = f32(f32(last - first + 1) / f32(mapping_width - 1.0))
def first_at(x):
    return math.trunc(f32(f32(x) * per_column)) + first
def last_at(x):
    return math.trunc(f32(f32(f32(x) + 1.0) * per_column)) + first - 1
def pos_at(frame):
    quotient = (frame - first) * f32(mapping_width - 1.0) / (last - first)
    return int(math.ceil(f32(quotient)) - 1)
def column_of(frame):
    # The column whose frames (first_at .. last_at, as the renderer
    # splits them) hold the frame.
    column = max(0, int((frame - first) / per_column) - 2)
    while last_at(column) < frame:
        column += 1
    return column
answers = {
    'column': column_of,
    'first': first_at,
    'last': last_at,
    'frame': lambda x: (first_at(x) + last_at(x)) // 2,
    'pos': pos_at,
}
pairs = sys.argv[4:]
print(','.join(str(answers[pairs[i]](int(pairs[i + 1]))) for i in range(0, len(pairs), 2)))
EOF
}

# --- Input -----------------------------------------------------------------

# Moves the pointer out of the window and waits out the double-click
# interval (400 ms), so that the next press in a view is a click of its
# own. Moving away also keeps the next `mousemove --sync` from waiting for a
# motion that never comes when the pointer is already where it is sent.
pause_clicks() {
    xdotool mousemove 0 0
    sleep 0.5
}

# Clicks column $2 of channel $1 (half way down) after a pause.
click_column() {
    pause_clicks
    click_at $(spot "$1" "$2")
}

# Two presses of button 1 120 ms apart in column $2 of channel $1, the
# second $3 pixels right of the first (default 0, the same spot).
double_click_column() {
    local x y apart=${3:-0}
    pause_clicks
    read -r x y <<<"$(spot "$1" "$2")"
    if [ "$apart" = 0 ]; then
        xdotool mousemove --sync "$x" "$y" click --repeat 2 --delay 120 1
    else
        xdotool mousemove --sync "$x" "$y" click 1 sleep 0.12 mousemove "$((x + apart))" "$y" click 1
    fi
}

# Drags with button $5 (default 1) from column $2 of channel $1 to screen
# ($3, $4), holding key $6 (e.g. ctrl; default none) from before the press
# to after the release.
drag_from() {
    local x y key=${6:-}
    pause_clicks
    read -r x y <<<"$(spot "$1" "$2")"
    [ -z "$key" ] || xdotool keydown "$key"
    drag "$x" "$y" "$3" "$4" "${5:-1}"
    [ -z "$key" ] || xdotool keyup "$key"
}

# --- Pixels ----------------------------------------------------------------

# The view columns of every channel whose pixel in the view's row 0 is
# blue (a cursor column) in screenshot $1: one line per channel, the
# columns space separated. Row 0 of a data column is empty with the test
# files' tones at half scale, so a cursor there is pure blue.
blue_columns() {
    local rows="" c
    for ((c = 0; c < ${#VIEW_X[@]}; c++)); do
        rows="$rows ${VIEW_X[$c]},${VIEW_Y[$c]},${VIEW_W[$c]}"
    done
    convert "$1" -depth 8 rgb:- | "$MOUSE_PYTHON" -c '
import sys
screen = int(sys.argv[1])
data = sys.stdin.buffer.read()
for row in sys.argv[2:]:
    x, y, width = (int(v) for v in row.split(","))
    blue = []
    for column in range(width):
        i = 3 * (y * screen + x + column)
        r, g, b = data[i:i + 3]
        if b >= r + 100 and b >= g + 100:
            blue.append(str(column))
    print(" ".join(blue))
' "$(identify -format %w "$1")" $rows
}

# Takes screenshot $1 and tells whether the only blue columns of row 0 of
# every channel are $2 (space separated view columns); sets $c to the first
# channel where they are not and $got to its blue columns.
cursor_columns_are() {
    local columns
    screenshot "$1"
    columns=$(blue_columns "$1")
    c=0
    while IFS= read -r got; do
        [ "$got" = "$2" ] || break
        c=$((c + 1))
    done <<<"$columns"
    [ "$c" = "${#VIEW_X[@]}" ]
}

# Fails unless the only blue columns of row 0 of every channel in
# screenshot $1 are the cursor's ($2, a view column; none when empty),
# taking the screenshot again for up to three seconds while the window may
# still be drawing.
expect_cursor_columns() {
    local c got
    retry_for 3 cursor_columns_are "$1" "$2" || fail "$1: blue columns of channel $c are '$got', expected '$2' ($3)"
}

# Waits for a pop-up menu of the editor (a visible window of its own other
# than the editor's window) and prints its top left corner as "X Y".
await_menu() {
    local id
    for _ in $(seq 50); do
        id=$(xdotool search --onlyvisible --pid "$app" 2>/dev/null | grep -vx "$window" | head -1 || true)
        if [ -n "$id" ]; then
            xdotool getwindowgeometry --shell "$id" | sed -n 's/^[XY]=//p' | paste -sd ' '
            return 0
        fi
        sleep 0.1
    done
    fail "no menu opened"
}

# Waits until the editor shows no pop-up menu.
await_no_menu() {
    for _ in $(seq 50); do
        xdotool search --onlyvisible --pid "$app" 2>/dev/null | grep -qvx "$window" || return 0
        sleep 0.1
    done
    fail "the menu stayed open"
}

# Reads the pop-up menu whose top left corner is at screen ($2, $3) from
# screenshot $1: one line per item, "Y X MARKS", with the screen y of the
# middle of the item's text, the screen x where its text starts, and how
# many pixels left of the text (where a check box, a check mark or a radio
# dot is drawn) differ from the menu's background. Items are told apart by
# their text: rows with dark pixels, with rows without between them.
menu_items() {
    local width=240 height=300
    convert "$1" -crop "${width}x${height}+$2+$3" +repage -depth 8 rgb:- | "$MOUSE_PYTHON" -c '
import sys
left, top, width = (int(v) for v in sys.argv[1:4])
data = sys.stdin.buffer.read()
height = len(data) // (3 * width)
def at(x, y):
    i = 3 * (y * width + x)
    return tuple(data[i:i + 3])
# Inside the one-pixel border: the background, up to the other border.
background = at(2, 1)
right = 2
while right + 1 < width and at(right + 1, 1) == background:
    right += 1
bottom = 2
while bottom + 1 < height and at(1, bottom + 1) == background:
    bottom += 1
def dark(p):
    return max(p) < 110
starts = {}
for y in range(2, bottom + 1):
    xs = [x for x in range(2, right + 1) if dark(at(x, y))]
    if xs:
        starts[y] = xs[0]
items = []
for y in sorted(starts):
    if items and y - items[-1][1] <= 2:
        items[-1][1] = y
    else:
        items.append([y, y])
if not items:
    sys.exit(0)
# A marked item starts with its mark; the text of most items starts at the
# same x.
ordered = sorted(starts.values())
text = ordered[len(ordered) // 2]
for first, last in items:
    marks = sum(1 for y in range(first, last + 1) for x in range(2, text - 3) if at(x, y) != background)
    print(top + (first + last) // 2, left + text, marks)
' "$2" "$3" "$width"
}
