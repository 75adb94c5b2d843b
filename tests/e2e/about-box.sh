#!/bin/bash
# The About box of a real window: opened from File > About, 400 x 50,
# centred on the screen, animating, and closed by a click inside it.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

# "About" among the File menu's items as the keyboard visits them (New,
# Open…, Append…, Save, Save As…, About).
ABOUT_ITEM=5
SCREEN_W=1024
SCREEN_H=768

# The About box's window id, or nothing while none is shown.
about_window() {
    xdotool search --onlyvisible --name '^About Window$' 2>/dev/null | head -1 || true
}

# Writes the About box's 400 x 50 pixels of screenshot $1 to $2.
crop_about() {
    convert "$1" -crop "400x50+$about_x+$about_y" +repage "$2"
}

# The number of pixels in which two pictures differ.
differing_pixels() {
    compare -metric AE "$1" "$2" null: 2>&1 || true
}

launch

note "File > About opens the box"
menu_pick "$MENU_FILE" "$ABOUT_ITEM"
about=$(wait_window '^About Window$')

note "400 x 50, centred on the screen"
eval "$(xdotool getwindowgeometry --shell "$about")"
about_x=$X
about_y=$Y
[ "$WIDTH" = 400 ] && [ "$HEIGHT" = 50 ] || fail "the About box is $WIDTH x $HEIGHT, expected 400 x 50"
[ "$X" = $(((SCREEN_W - 400) / 2)) ] && [ "$Y" = $(((SCREEN_H - 50) / 2)) ] \
    || fail "the About box is at ($X, $Y), expected ($(((SCREEN_W - 400) / 2)), $(((SCREEN_H - 50) / 2)))"

note "it animates: grey text on black that changes from frame to frame"
sleep 0.3
screenshot about-1.png
sleep 0.4
screenshot about-2.png
crop_about about-1.png box-1.png
crop_about about-2.png box-2.png
changed=$(differing_pixels box-1.png box-2.png)
[ "$changed" -gt 50 ] || fail "only $changed pixels of the About box changed in 0.4 s (box-1.png, box-2.png)"
# Nothing but greys, and black at the corners.
colours=$(convert box-2.png -format '%c' histogram:info:- | grep -Eo '#[0-9A-F]{6}' | sort -u)
while read -r colour; do
    [ "${colour:1:2}" = "${colour:3:2}" ] && [ "${colour:3:2}" = "${colour:5:2}" ] \
        || fail "the About box shows $colour, which is not a grey (box-2.png)"
done <<<"$colours"
expect_pixel box-2.png 0 0 "0,0,0" "the About box's corner"
lit=$(convert box-2.png -threshold 1% -format '%[fx:round(mean*w*h)]' info:)
[ "$lit" -gt 100 ] || fail "only $lit pixels of the About box are lit (box-2.png)"

note "the document window stays behind it"
expect_state '.active' false "the document window under the About box"

note "a click closes it"
click_at $((about_x + 300)) $((about_y + 25))
for _ in $(seq 50); do
    [ -z "$(about_window)" ] && break
    sleep 0.1
done
[ -z "$(about_window)" ] || fail "the About box is still open after a click"
screenshot closed.png
expect_state '.active' true "the document window is active again"

note "it opens again, and a click in another corner closes it again"
menu_pick "$MENU_FILE" "$ABOUT_ITEM"
about=$(wait_window '^About Window$')
click_at $((about_x + 5)) $((about_y + 45))
for _ in $(seq 50); do
    [ -z "$(about_window)" ] && break
    sleep 0.1
done
[ -z "$(about_window)" ] || fail "the second About box is still open after a click"
[ "$(window_count)" = 1 ] || fail "the editor shows $(window_count) windows after the About box"

quit_app
