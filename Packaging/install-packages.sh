#!/usr/bin/env bash
# Installs the Debian packages of debian-packages.txt that are missing; does nothing when all are there.
set -euo pipefail
here=$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)
list="$here/debian-packages.txt"

if ! command -v dpkg-query >/dev/null 2>&1; then
    echo "install-packages: this is no Debian system; install what $list names by hand" >&2
    exit 0
fi

missing=()
while read -r package; do
    case "$package" in '' | '#'*) continue ;; esac
    if [ "$(dpkg-query -W -f='${db:Status-Status}' "$package" 2>/dev/null || true)" != installed ]; then
        missing+=("$package")
    fi
done <"$list"
[ ${#missing[@]} -eq 0 ] && exit 0

as_root=()
if [ "$(id -u)" -ne 0 ]; then
    if ! command -v sudo >/dev/null 2>&1; then
        echo "install-packages: missing packages, and neither root nor sudo: ${missing[*]}" >&2
        exit 1
    fi
    as_root=(sudo)
fi
echo "install-packages: installing ${missing[*]}"
export DEBIAN_FRONTEND=noninteractive
"${as_root[@]}" apt-get update -qq
"${as_root[@]}" apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null
