#!/bin/bash
# Installs a build into a fresh prefix and checks that the result is usable:
# the program runs from there, and desktops find its entry and its icon.
#
#   install-prefix.sh BUILD_DIR PREFIX
set -euo pipefail

build=$1
prefix=$2
rm -rf "$prefix"

fail() {
    echo "FAIL: $*" >&2
    exit 1
}

cmake --install "$build" --prefix "$prefix" >/dev/null

program="$prefix/bin/glimmet"
entry="$prefix/share/applications/glimmet.desktop"
icons="$prefix/share/icons/hicolor"
for file in "$program" "$entry" "$icons/64x64/apps/glimmet.png" "$icons/128x128/apps/glimmet.png"; do
    [ -f "$file" ] || fail "$file was not installed"
done
[ -x "$program" ] || fail "$program is not executable"

desktop-file-validate "$entry" || fail "the desktop entry does not validate"
value() {
    sed -n "s/^$1=//p" "$entry"
}
[ "$(value Name)" = "Glimmet" ] || fail "Name is '$(value Name)'"
[ "$(value Exec)" = "glimmet %F" ] || fail "Exec is '$(value Exec)'"
[ "$(value MimeType)" = "audio/*;" ] || fail "MimeType is '$(value MimeType)'"
[ "$(value Icon)" = "glimmet" ] || fail "Icon is '$(value Icon)'"
[ "$(value Type)" = "Application" ] || fail "Type is '$(value Type)'"

# Each icon is a picture of the size its folder names.
for size in 64 128; do
    got=$(identify -format '%wx%h' "$icons/${size}x$size/apps/glimmet.png" 2>/dev/null) \
        || fail "the $size pixel icon cannot be read"
    [ "$got" = "${size}x$size" ] || fail "the $size pixel icon is $got"
done

# The installed program works on its own.
state=$(printf 'addc\nprint\n' | SDL_AUDIODRIVER=dummy "$program" --batch - 2>/dev/null | grep '^{') \
    || fail "the installed program did not run a script"
case "$state" in
    *'"undo": "Add Channel"'*) ;;
    *) fail "the installed program printed: $state" ;;
esac
echo "installed into $prefix: program, desktop entry and icon"
