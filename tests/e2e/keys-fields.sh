#!/bin/bash
# The range fields: they take digits and '-', refuse letters, and apply an
# entry on Enter or when the focus leaves them.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav
{
    printf 'open %s\nrange 500 1234\nprint\nrange -1 -1\nprint\nrange -1 3000\nprint\nrange 2000 3000\nprint\n' "$PWD/in.wav"
} | batch | jq -c '.range' >expected.txt
launch in.wav

note "letters are refused, Enter applies"
field_click 0
xdotool key ctrl+a
xdotool type --delay 5 "5x0q0"
expect_state '.fields[0]' "500" "the start field refuses letters"
expect_state '.range' "[-1,-1]" "typing alone changes no range"
xdotool key Return
field_click 1
xdotool key ctrl+a
xdotool type --delay 5 "12a3B4"
expect_state '.fields[1]' "1234" "the end field refuses letters"
xdotool key Return
expect_state '.range' "$(sed -n 1p expected.txt)" "500 and 1234 entered"

note "'-' is taken"
type_range_field 0 "-1"
type_range_field 1 "-1"
expect_state '.fields' '["-1","-1"]' "the fields take '-'"
expect_state '.range' "$(sed -n 2p expected.txt)" "-1 and -1 entered"

note "leaving a field applies it"
type_range_field 1 "3000"
expect_state '.range' "$(sed -n 3p expected.txt)" "3000 entered as the end"
field_click 0
xdotool key ctrl+a
xdotool type --delay 5 "2000"
xdotool key Tab
expect_state '.range' "$(sed -n 4p expected.txt)" "2000 typed into the start field, then Tab"
quit_app
