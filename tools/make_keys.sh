#!/usr/bin/env bash
# Makes a new key pair for the encrypted packages, in the forms that the program takes.
# usage: tools/make_keys.sh FOLDER
#   FOLDER/public_key.pem    one PEM line; compiled in with -DST_PUBLIC_KEY_FILE=FOLDER/public_key.pem
#   FOLDER/private_key.pem   opens packages; readable by its owner only. Keep it off every machine that builds or ships.
# Nothing that is already there is overwritten: a lost private key makes every package for it unreadable.
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: tools/make_keys.sh FOLDER" >&2; exit 2; }
mkdir -p "$1"
private=$1/private_key.pem
public=$1/public_key.pem
for file in "$private" "$public"; do
  [ ! -e "$file" ] || { echo "tools/make_keys.sh: $file is already there; it stays as it is." >&2; exit 1; }
done

# The format of the packages fixes RSA with 1024 bits and the public exponent 65537 (openssl's default).
(umask 077 && openssl genrsa -traditional 1024 > "$private" 2> /dev/null) || {
  rm -f "$private"
  echo "tools/make_keys.sh: openssl could not make a key." >&2
  exit 1
}
openssl rsa -in "$private" -pubout 2> /dev/null | tr -d '\r\n' > "$public"
