#!/usr/bin/env bash
# The walk through the whole: a hub in a directory of its own, a folder of real media imported as a
# production, and a user who signs in, opens it, reads everything back and follows it to a newer commit. Then two
# users work on it, each in a session: they change, share, get the latest and decide a conflict.
#
# usage: demo.sh BUILD_DIRECTORY (or the directory that holds zo and zohub)
set -euo pipefail

here="$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)"
media="$here/../../Tests/Media/sample-production"
bin="${1:?usage: demo.sh BUILD_DIRECTORY}"
[[ -x "$bin/bin/zo" ]] && bin="$bin/bin"
bin="$(cd "$bin" && pwd)"
zo="$bin/zo"
zohub="$bin/zohub"

work="$(mktemp -d "${TMPDIR:-/tmp}/zo-demo.XXXXXX")"
hub_pid=""
step="setting up"

# Nothing of the user's own settings and logins is touched or used.
export ZOCLIENT_CONFIG_HOME="$work/config" ZOCLIENT_CACHE_HOME="$work/cache" ZOCLIENT_STATE_HOME="$work/state"
unset ZOCLIENT_SERVER ZOCLIENT_USER ZOCLIENT_CA_FILE ZOCLIENT_PROXY SSL_CERT_FILE SSL_CERT_DIR
export NO_PROXY="127.0.0.1,localhost" no_proxy="127.0.0.1,localhost"

stop_hub() {
  [[ -n "$hub_pid" ]] || return 0
  kill -TERM "$hub_pid" 2>/dev/null || true
  wait "$hub_pid" 2>/dev/null || true
  hub_pid=""
}
finish() {
  local code=$?
  stop_hub
  if [[ $code -ne 0 ]]; then
    echo "demo: FAILED while $step (exit code $code)" >&2
    [[ -s "$work/zohub.log" ]] && { echo "--- the hub said:" >&2; tail -n 20 "$work/zohub.log" >&2; }
  fi
  rm -rf "$work"
  exit "$code"
}
trap finish EXIT
trap 'exit 130' INT TERM

if [[ -t 1 && -z "${NO_COLOR:-}" ]]; then bold=$'\033[1m'; plain=$'\033[0m'; else bold=""; plain=""; fi
tell() { step="$1"; printf '\n%s== %s%s\n' "$bold" "$1" "$plain"; }
run() { printf '%s$ %s%s\n' "$bold" "${*//"$bin/"/}" "$plain"; "$@"; }
fail() { echo "demo: $1" >&2; exit 1; }
# The value of a key in the first JSON line of standard input.
value() { python3 -c 'import json,sys; print(json.loads(sys.stdin.readline())[sys.argv[1]])' "$1"; }

start_hub() {
  local ready="$work/ready.json"
  rm -f "$ready"
  "$zohub" serve --data "$work/hub" --port 0 --tls-port 0 --ready-file "$ready" >>"$work/zohub.log" 2>&1 &
  hub_pid=$!
  python3 - "$ready" "$hub_pid" <<'PY' || fail "the hub did not start"
import json, os, select, sys
ready, pid = sys.argv[1], int(sys.argv[2])
descriptor = os.pidfd_open(pid)
poll = select.poll()
poll.register(descriptor, select.POLLIN)
while not os.path.exists(ready):
    if poll.poll(20):
        sys.exit(1)
PY
  http_url="$(value httpUrl <"$ready")"
  tls_url="$(value tlsUrl <"$ready")"
  ca_file="$(value caFile <"$ready")"
}

[[ -x "$zo" && -x "$zohub" ]] || fail "zo and zohub are not in $bin; build them first"
[[ -d "$media" ]] || fail "the sample media are missing: $media"

tell "A folder of media, with XMP sidecars"
cp -R "$media" "$work/media"
(cd "$work/media" && find . -type f | sort)

tell "A hub of its own, on free ports"
(umask 077 && head -c 24 /dev/urandom | base64 >"$work/password")
run "$zohub" user add ada --data "$work/hub" --password-file "$work/password"
run "$zohub" import "$work/media" --data "$work/hub" --production "Harbour Film" --owner ada
start_hub
echo "hub: $http_url and $tls_url"

tell "Signing in"
run "$zo" login --server "$http_url" --user ada --password-file "$work/password"
run "$zo" whoami

tell "What the hub holds"
run "$zo" productions
run "$zo" open "Harbour Film"
first="$("$zo" show --json | value commit)"
run "$zo" show
run "$zo" assets --long

tell "Reading every payload back, byte for byte"
run "$zo" get --all --quiet -o "$work/got/"
compared=0
while IFS= read -r -d '' file; do
  name="${file#"$work/got/"}"
  case "$name" in
    *.xmp)
      base="${name%.xmp}"
      source="$work/media/$base.xmp"
      [[ -f "$source" ]] || source="$work/media/${base%.*}.xmp" ;;
    *) source="$work/media/$name" ;;
  esac
  [[ -f "$source" ]] || fail "$name was fetched, but no such file was imported"
  cmp "$source" "$file" || fail "$name is not what was imported"
  compared=$((compared + 1))
done < <(find "$work/got" -type f -print0)
sidecars=$(find "$work/media" -name '*.xmp' | wc -l)
fetched_sidecars=$(find "$work/got" -name '*.xmp' | wc -l)
pictures=$(find "$work/media" \( -name '*.jpg' -o -name '*.jpeg' -o -name '*.png' \) | wc -l)
fetched_pictures=$(find "$work/got" \( -name '*.jpg' -o -name '*.jpeg' -o -name '*.png' \) | wc -l)
[[ "$sidecars" -gt 0 && "$sidecars" -eq "$fetched_sidecars" ]] ||
  fail "$fetched_sidecars of $sidecars sidecars came back"
[[ "$pictures" -gt 0 && "$pictures" -eq "$fetched_pictures" ]] ||
  fail "$fetched_pictures of $pictures pictures came back"
echo "$compared files are the same, $sidecars sidecars and $pictures pictures among them"

tell "The folder changes, and is imported again: a second commit"
changed="$(find "$work/media" -name '*.xmp' | sort | head -n 1)"
printf '<!-- graded -->\n' >>"$changed"
run "$zohub" import "$work/media" --data "$work/hub" --production "Harbour Film" --owner ada

tell "The open production stays at its commit until it is moved on"
run "$zo" open "Harbour Film" --commit "$first"
held="$("$zo" show --json | value commit)"
[[ "$held" == "$first" ]] || fail "the old commit did not open"
run "$zo" open --latest
second="$("$zo" show --json | value commit)"
[[ "$second" != "$first" ]] || fail "latest-version led to the old commit"
asset="$(basename "${changed%.xmp}")"
echo "moved from $first to $second ($asset has a new sidecar)"

tell "The same over TLS, trusting the hub's own authority"
run "$zo" login --server "$tls_url" --user ada --password-file "$work/password" --ca "$ca_file"
run "$zo" open "Harbour Film"
run "$zo" get --all --quiet -o "$work/got-tls/"
find "$work/got-tls" -name '*.xmp' -exec grep -l graded {} + >/dev/null || fail "the new sidecar did not come over TLS"
files=$(find "$work/got-tls" -type f | wc -l)
[[ "$files" -eq "$compared" ]] || fail "$files of $compared files came over TLS"
echo "$files files came over TLS"

tell "Signing out"
run "$zo" logout

tell "Two users, each with a session of their own"
ada() { as ada "$@"; }
ben() { as ben "$@"; }
# A user is a state directory and a login; the command line is shown as that user would type it.
as() {
  local who="$1"
  shift
  printf '%s%s$ zo %s%s\n' "$bold" "$who" "$*" "$plain" >&2
  ZOCLIENT_CONFIG_HOME="$work/$who/config" ZOCLIENT_STATE_HOME="$work/$who/state" "$zo" "$@"
}
# Runs a command that has to end with a certain exit code.
ends_with() {
  local wanted="$1" code=0
  shift
  "$@" || code=$?
  [[ $code -eq $wanted ]] || fail "'$*' ended with code $code instead of $wanted"
}
stop_hub
(umask 077 && head -c 24 /dev/urandom | base64 >"$work/ben-password")
run "$zohub" user add ben --data "$work/hub" --password-file "$work/ben-password"
run "$zohub" import "$work/media" --data "$work/hub" --production "Harbour Film" --owner ada --grant ben
start_hub
ada login --server "$http_url" --user ada --password-file "$work/password"
ben login --server "$http_url" --user ben --password-file "$work/ben-password"
ada open "Harbour Film"
ben open "Harbour Film"

tell "Ada adds a new take with its sidecar and changes a name; nobody sees it before she shares it"
mkdir "$work/day2"
cp "$work/media/broll/lighthouse.jpg" "$work/day2/lighthouse-night.jpg"
cp "$work/media/broll/lighthouse.xmp" "$work/day2/lighthouse-night.xmp"
ada add --name "Day 2" --type bin
ada add "$work/day2/lighthouse-night.jpg" --parent "Day 2" -m "The lighthouse at night"
ada set --asset gulls.jpg "name=Gulls at dawn"
ada status
ben assets --json | grep -q lighthouse-night && fail "Ben sees what Ada has not shared"
ben set --asset gulls.jpg "name=Gulls, loud"
ben xmp set harbour-wide.mp4 "$work/media/broll/gulls.xmp"
ada share -m "Night takes"

tell "Ben has changed the same name meanwhile, and cannot share before he has got the latest"
ends_with 4 ben share -m "My changes"
ben latest --dry-run
ends_with 3 ben latest
ends_with 3 ben conflicts
ben resolve --theirs --all
ben share -m "New metadata of the wide shot"

tell "What Ada sent is on Ben's side, byte for byte, and the other way round"
ben get lighthouse-night.jpg --output "$work/ben-got/"
cmp "$work/day2/lighthouse-night.jpg" "$work/ben-got/lighthouse-night.jpg" || fail "the picture is another one"
cmp "$work/day2/lighthouse-night.xmp" "$work/ben-got/lighthouse-night.jpg.xmp" || fail "the sidecar is another one"
ada latest
ada xmp get harbour-wide.mp4 --output "$work/ada-got.xmp"
cmp "$work/media/broll/gulls.xmp" "$work/ada-got.xmp" || fail "the metadata are others"
ada history --shared
ada history --count 3

tell "A transaction over two changes, and the way back"
ada set --asset slate.png "description=Scene 4" --keep-open
ada rm room-tone.wav
ada pending
ada rollback
ada status

tell "A whole folder with its sidecars comes in at once, and again only as far as it is missing"
cp -R "$work/media/broll" "$work/day3"
ada ingest "$work/day3"
cp "$work/media/slate.png" "$work/day3/slate.png"
ada ingest "$work/day3"
added="$(ada ingest "$work/day3" --json | tail -n 1 | value added)"
[[ "$added" -eq 0 ]] || fail "a folder that is there was added again"

tell "A look at the hub's books"
stop_hub
run "$zohub" check --data "$work/hub"

step="ending"
printf '\ndemo: ok\n'
