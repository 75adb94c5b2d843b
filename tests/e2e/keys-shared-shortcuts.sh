#!/bin/bash
# The two shortcuts that two menu items share: Ctrl+O ("Open…" in File,
# "Fade Out" in Tools) and Ctrl+E ("Envelope…" in Tools, "Show All" in
# View). The key does what the item first in menu-bar order does; both items
# show the shortcut, and the second ones still work from their menus.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav
launch in.wav
drag_range 0 0.3 0.6

# Screenshot $2 of item $3 of menu $1, open, and the crop of its shortcut
# text; closes the menu again.
shortcut_of() {
    menu_open_at "$1" "$3"
    screenshot "menu-$2.png"
    menu_shortcut_crop "menu-$2.png" "shortcut-$2.png"
    xdotool key Escape Escape
    sleep 0.2
}

note "both items of a pair show the shortcut"
shortcut_of "$MENU_FILE" open 1
shortcut_of "$MENU_FILE" append 2
shortcut_of "$MENU_TOOLS" fade-out 1
shortcut_of "$MENU_TOOLS" envelope 3
shortcut_of "$MENU_VIEW" show-all 1
shortcut_of "$MENU_VIEW" zoom-range 0
same() {
    local differing
    differing=$(pixels_differing "shortcut-$1.png" "shortcut-$2.png")
    [ "$differing" = 0 ] || fail "the shortcuts of $1 and $2 differ in $differing pixels"
}
same open fade-out
same envelope show-all
# The comparison tells shortcuts apart.
[ "$(pixels_differing shortcut-open.png shortcut-append.png)" != 0 ] \
    || fail "Ctrl+O and Ctrl+Shift+O look alike"
[ "$(pixels_differing shortcut-show-all.png shortcut-zoom-range.png)" != 0 ] \
    || fail "Ctrl+E and Ctrl+R look alike"

note "Fade Out and Show All from their menus"
xdotool key ctrl+r
expect_state '.display[0] > 0' true "Ctrl+R zooms in"
zoomed=$(state_field '.display')
menu_pick "$MENU_VIEW" 1
expect_state '.display' "[0,$(($(state_field '.frames') - 1))]" "View > Show All"
menu_pick "$MENU_TOOLS" 1
expect_state '.undo' "Fade Out" "Tools > Fade Out"
xdotool key ctrl+z
expect_state '[.undo, .saved]' '[null,true]' "the fade undone"

note "Ctrl+E is Envelope…, not Show All"
xdotool key ctrl+r
expect_state '.display' "$zoomed" "Ctrl+R zooms in again"
xdotool key ctrl+e
expect_state '.dialog.title' "Envelope" "Ctrl+E opens the Envelope dialog"
expect_state '[.display, .undo]' "[$zoomed,null]" "Ctrl+E leaves the zoom as it was"
expect_no_log "Ambiguous" "a shortcut is ambiguous"
# Escape in the dialog cancels it: nothing recorded.
xdotool key Escape
expect_state '[.dialog.title, .undo]' '[null,null]' "Escape in the Envelope dialog"
xdotool windowactivate --sync "$window" 2>/dev/null || true

note "Ctrl+O is Open…, not Fade Out"
xdotool key ctrl+o
[ -n "$(find_window "Select A Sound File")" ] || fail "Ctrl+O showed no open panel"
expect_state '[.undo, .saved]' '[null,true]' "Ctrl+O fades nothing"
expect_no_log "Ambiguous" "a shortcut is ambiguous"
quit_app
