#!/bin/bash
# "Open…" in a real window: the sound panel comes up titled "Select A Sound
# File", lists folders and sound files but not a text file, and a chosen
# sound opens in the window.
#
#   open-panel.sh GLIMMET WORKDIR
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

mkdir -p sounds/inner
make_stereo sounds/tone.wav 1
printf 'just words\n' >sounds/notes.txt
make_stereo first.wav 1
launch first.wav

xdotool key ctrl+o
panel=$(wait_window '^Select A Sound File$')
expect_state '.panel.title' "Select A Sound File" "Ctrl+O"
# Into the folder: its path typed into the name field, then Enter.
xdotool windowactivate --sync "$panel" 2>/dev/null || true
xdotool type --delay 20 "$PWD/sounds/"
xdotool key Return
expect_state '.panel.folder' "$PWD/sounds" "the folder typed into the panel"
expect_state '.panel.listed | @csv' '"inner","tone.wav"' "what the panel lists"
screenshot 01-panel.png

# The sound chosen by name opens in the window that asked.
xdotool type --delay 20 "tone.wav"
xdotool key Return
expect_state '.title' "Glimmet - tone.wav" "Select"
expect_state '.panel' null "the panel after the choice"
screenshot 02-opened.png
echo "real window: the panel listed inner and tone.wav, not notes.txt"
