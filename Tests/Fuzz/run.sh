#!/usr/bin/env bash
# Lets one fuzzer run over its seeds and what former runs have found: run.sh BUILD NAME SECONDS
# What it finds lies in BUILD/fuzz/NAME, and the program ends with a failure.
set -euo pipefail
build=$(realpath "$1") name=$2 seconds=$3
here=$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)
seeds=$here/corpus/$name
[ "$name" = layout ] && seeds=$here/../../Resources/layouts
corpus=$build/fuzz/$name/corpus
mkdir -p "$corpus"
[ -f "$here/found/$name.tar.xz" ] && tar -xJf "$here/found/$name.tar.xz" -C "$corpus"
exec "$build/bin/fuzz_$name" -max_total_time="$seconds" -timeout=60 -rss_limit_mb=3000 -print_final_stats=1 \
    -artifact_prefix="$build/fuzz/$name/" "$corpus" "$seeds"
