#!/usr/bin/env bash
# The Wine session in which programs of the build run: one prefix and one server, inside the build folder.
#   tools/wine_session.sh up | down        source tools/wine_session.sh   (only sets the environment)
#
# The server is started here with its output closed off and is told to stay: a server that a test had started would hold
# that test's pipes open. The debugger is disabled, because with it a crashed program can exit with status 0.

st_wine_root=${ST_WINE_ROOT:-$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)/build/wine}
export LC_ALL=C.UTF-8 LANG=C.UTF-8 # otherwise file names outside ASCII cannot be created
export WINEARCH=win64 WINEDEBUG=-all WINEPREFIX=$st_wine_root/prefix
export WINEDLLOVERRIDES="winedbg.exe=d;winemenubuilder.exe=d;mscoree=;mshtml="
export HOME=$st_wine_root/home # the prefix links the user's Documents, Desktop, … into $HOME
unset DISPLAY

st_wine_up() {
  mkdir -p "$HOME"
  if [ ! -e "$WINEPREFIX/st-ready" ]; then
    rm -rf "$WINEPREFIX"
    wineboot -i < /dev/null > /dev/null 2>&1
    wineserver -w < /dev/null > /dev/null 2>&1
    touch "$WINEPREFIX/st-ready"
  fi
  # The server of a session before this one may just be ending, and takes the first program with it.
  for _ in 1 2 3; do
    wineserver -p600 < /dev/null > /dev/null 2>&1 || true
    wine cmd /c exit < /dev/null > /dev/null 2>&1 && return
    sleep 1
  done
  echo "wine_session.sh: Wine does not start a program in $WINEPREFIX; try: wine cmd /c exit" >&2
  return 1
}

st_wine_down() {
  wineserver -k < /dev/null > /dev/null 2>&1 || true
  wineserver -w < /dev/null > /dev/null 2>&1 || true
}

if [ "${BASH_SOURCE[0]}" = "$0" ]; then
  case ${1:-} in
    up) st_wine_up ;;
    down) st_wine_down ;;
    *) echo "usage: tools/wine_session.sh up | down" >&2; exit 2 ;;
  esac
fi
