#!/bin/bash
# Closing an edited window and answering "Yes, please." to "Save changes?"
# when the save cannot be written: the window stays open with its edits, the
# file on disk stays as it was and no temporary file is left beside it. Once
# the save can be written, the same answer saves and closes.
#
# The failure is a real one: the editor runs under a file-size limit smaller
# than the file it saves, which a root user cannot side-step as it can a
# read-only folder. Screenshots stay in WORKDIR for inspection.
. "$(dirname "$0")/lib.sh"
. "$(dirname "$0")/support/keys.sh"
e2e_begin "$@"

make_stereo in.wav
cp in.wav original.wav

# 64 KiB (a soft limit, so that it can be lifted later): far below the 345 KiB the saved file needs.
real_glimmet=$GLIMMET
cat > limited <<LIMITED
#!/bin/bash
ulimit -S -f 64
exec "$real_glimmet" "\$@"
LIMITED
chmod +x limited
GLIMMET=$PWD/limited
launch in.wav
GLIMMET=$real_glimmet

read -r start_x start_y <<<"$(view_point 0 0.2 0.5)"
read -r end_x end_y <<<"$(view_point 1 0.7 0.5)"
drag "$start_x" "$start_y" "$end_x" "$end_y"
xdotool key ctrl+i
expect_state '.undo' "Fade In" "Ctrl+I"
expect_state '.saved' "false" "the edit"
screenshot 01-edited.png

xdotool key ctrl+w
await_alert "the edited window"
screenshot 02-save-changes.png
# The default button is "Don't quit!"; "Yes, please." is the one before it.
xdotool key shift+Tab space

# The save fails: the answer must not close the window.
for _ in $(seq 30); do
    grep -q "error writing file" app.log && break
    sleep 0.1
done
grep -q "error writing file. (File too large)" app.log \
    || fail "no \"error writing file. (File too large)\" in the editor's output: $(cat app.log)"
settle 1
kill -0 "$app" 2>/dev/null || fail "the window closed although its save failed"
expect_state '.title' "Glimmet - in.wav" "the window after the failed save"
expect_state '.undo' "Fade In" "the edit after the failed save"
expect_state '.saved' "false" "the document after the failed save"
cmp -s in.wav original.wav || fail "the failed save changed in.wav"
leftovers=$(find . -maxdepth 1 -name '.glimmet-*' | wc -l)
[ "$leftovers" = 0 ] || fail "the failed save left $leftovers temporary file(s)"
reactivate
screenshot 03-still-open.png

# Lift the limit; the same answer now saves and closes.
prlimit --pid "$app" --fsize=unlimited:
xdotool key ctrl+w
await_alert "the window after the failed save"
xdotool key shift+Tab space
await_exit "after the answer with room to save"
cmp -s in.wav original.wav && fail "closing with \"Yes, please.\" did not save the edit"
[ "$(stat -c %s in.wav)" = "$(stat -c %s original.wav)" ] || fail "the saved file has another size"
echo "real window: a failed save kept the window and the file; the next one saved and closed"
