# shellcheck shell=sh
# For sh -c MARK PROFILE BROWSER ARGUMENTS: ends the browser when MARK is gone, and leaves nothing behind. The system of the
# one who made MARK deletes it with him; if that system itself was killed, MARK is no longer touched.
mark=$1; profile=$2; shift 2
# What was left when a browser and its watch were killed together.
for old in "${profile%/*}"/st-engine-*; do [ -d "$old" ] && [ ! -e "$old.life" ] && rm -rf "$old"; done
TMPDIR=$profile "$@" </dev/null >/dev/null 2>"$profile/browser.log" & browser=$!
is_touched() { [ -n "$(find "$mark" -mmin -0.35 2>/dev/null)" ]; }
# A machine that slept looks like a mark that nobody touches, for a moment.
is_owned() { is_touched || { [ -e "$mark" ] && sleep 5 && is_touched; }; }
while kill -0 $browser 2>/dev/null && is_owned; do sleep 1; done
kill $browser 2>/dev/null && sleep 1; kill -9 $browser 2>/dev/null
is_touched && : >"$profile/ended" && sleep 5
rm -rf "$profile" "$mark"
# The browser's other processes notice its end a little later, and may have written once more.
sleep 1; rm -rf "$profile"
