#!/usr/bin/env bash
# Installs what the page tests need, exactly as package-lock.json says. Does nothing when that is done already.
set -euo pipefail
cd "$(dirname "$0")"
[ node_modules/.package-lock.json -nt package-lock.json ] || npm ci --no-audit --no-fund
