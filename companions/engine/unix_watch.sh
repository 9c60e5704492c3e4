# shellcheck shell=sh
# For sh -c LIFE PROFILE BROWSER ARGUMENTS: ends the browser when LIFE is no longer touched, and leaves nothing behind.
life=$1; profile=$2; shift 2
"$@" </dev/null >/dev/null 2>"$profile/browser.log" & browser=$!
while kill -0 $browser 2>/dev/null && [ -n "$(find "$life" -mmin -0.35 2>/dev/null)" ]; do sleep 1; done
kill $browser 2>/dev/null && sleep 1; kill -9 $browser 2>/dev/null
[ -e "$life" ] && : >"$profile.ended" && sleep 5
rm -rf "$profile" "$profile.ended" "$life" "$life.partial"
