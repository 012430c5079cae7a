# Shared by the scripts beside it: steps with logs, the two Wines, a display, servers, and an end without leftovers.
# Sourced, never run.

set -euo pipefail

root=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
build=$root/build
logs=$build/logs
cd "$root"
mkdir -p "$logs"

# The 32-bit packages of Wine do not install beside the 64-bit ones, so 32-bit Wine lives in a root folder of its
# own. It takes minutes to make and does not depend on this checkout, hence outside of it.
wine32_root=${TARNWICK_CACHE:-/var/cache/tarnwick}/wine32

# Where the Wine prefixes are, one folder for each architecture. A script that must not meet another one's prefix
# sets its own.
wine_home=$build/wine

# ---- Steps --------------------------------------------------------------------------------------------------------

# try_step NAME COMMAND...: runs the command with its output in build/logs/NAME.log; tells the time that it took, or the
# log and its last lines when it fails. The command's result is left in `step_result`. The command runs in a subshell:
# what shall outlive the step (a server, a variable) is started with start_server.
try_step() {
  local name=$1 log=$logs/${1// /-}.log begin=$SECONDS
  shift
  set +e
  # Below a condition, however far, the shell ignores errors in the middle of a function.
  (set -e; false; true)
  step_result=$?
  ((step_result != 0)) || die "the step $name is part of a condition, where it could not fail"
  printf '== %s ... ' "$name"
  (set -e; "$@") >"$log" 2>&1 </dev/null
  step_result=$?
  set -e
  if ((step_result == 0)); then
    printf 'done, %d s\n' $((SECONDS - begin))
  else
    printf 'FAILED with %d after %d s; log: %s\n' "$step_result" $((SECONDS - begin)) "${log#"$root"/}"
    tail -n 25 "$log" | sed 's/^/   | /'
  fi
}

# The same, for a step without which the rest makes no sense.
step() {
  try_step "$@"
  ((step_result == 0)) || exit 1
}

die() {
  printf '%s\n' "$*" >&2
  exit 1
}

# build_preset PRESET [TARGET...]: all there is, or the targets, for which a folder that is new is made without the tests.
build_preset() {
  local preset=$1
  shift
  if (($# == 0)); then
    configure_tests "$preset"
  elif [[ ! -f $build/$preset/build.ninja ]]; then
    cmake --preset "$preset" -DBUILD_TESTING=OFF
  fi
  cmake --build --preset "$preset" -j 2 "${@/#/--target=}"
}

# configure_tests PRESET: makes the folder with the tests in it, unless it is so already.
configure_tests() {
  [[ -f $build/$1/build.ninja ]] && ! grep -q '^BUILD_TESTING:BOOL=OFF' "$build/$1/CMakeCache.txt" ||
    cmake --preset "$1" -DBUILD_TESTING=ON
}

# ---- What was started is ended -------------------------------------------------------------------------------------

started=()  # process ids

# stop_servers N: ends the last N that were started.
stop_servers() {
  local i pid
  for ((i = 0; i < $1; i++)); do
    pid=${started[-1]}
    unset 'started[-1]'
    kill "$pid" 2>/dev/null || true
    wait "$pid" 2>/dev/null || true
  done
}

stop_everything() {
  local arch
  for arch in x64 x86; do
    # A prefix that is there may have a server, whoever was interrupted in the middle of starting it.
    [[ ! -d $wine_home/$arch ]] || wine_stop "$arch" 2>/dev/null || true
  done
  stop_servers "${#started[@]}"
}
trap stop_everything EXIT
trap 'exit 130' INT
trap 'exit 143' TERM

# start_server NAME PATTERN COMMAND...: starts a server in the background, with its output in build/logs/NAME.log, and
# waits until that holds a line that matches PATTERN. The line is left in `server_line`.
start_server() {
  local name=$1 log=$logs/${1// /-}.log pattern=$2 i
  shift 2
  printf '== %s ... ' "$name"
  # Emptied here: the server may be slower to begin than its line is looked for, and the last one's would be taken.
  : >"$log"
  "$@" >"$log" 2>&1 </dev/null &
  local pid=$!
  started+=("$pid")
  for ((i = 0; i < 150; i++)); do
    server_line=$(grep -s -m 1 -E "$pattern" "$log" || true)
    if [[ -n $server_line ]]; then
      printf 'started\n'
      return 0
    fi
    kill -0 "$pid" 2>/dev/null || break
    sleep 0.1
  done
  printf 'FAILED to start; log: %s\n' "${log#"$root"/}"
  tail -n 10 "$log" | sed 's/^/   | /'
  return 1
}

# start_display [WIDTHxHEIGHT]
start_display() {
  start_server "display" '^[0-9]+$' Xvfb -displayfd 1 -screen 0 "${1-1280x960}x24" -nolisten tcp || return 1
  export DISPLAY=:$server_line
}

# ---- Wine ----------------------------------------------------------------------------------------------------------

# Variables for programs under Wine, as NAME=VALUE.
wine_environment=()

# Seconds after which a program under Wine counts as hanging, and what it reads.
wine_limit=600
wine_input=/dev/null

# A command in the 32-bit root, with this checkout at the same path. The mounts are made in a name space of their own
# and go when the command ends; one wineserver still serves all commands, because its socket is below /tmp.
in_wine32() {
  local script='
    top=$1 checkout=$2; shift 2
    mount --rbind /proc "$top/proc"
    mount --rbind /dev "$top/dev"
    mount --bind /tmp "$top/tmp"
    mkdir -p "$top$checkout"
    mount --bind "$checkout" "$top$checkout"
    exec chroot "$top" /usr/bin/env --chdir="$checkout" PATH=/usr/lib/wine:/usr/sbin:/usr/bin:/sbin:/bin "$@"'
  unshare --mount --propagation private timeout -k 10 "$wine_limit" \
    bash -ec "$script" in_wine32 "$wine32_root" "$root" "$@"
}

# wine_command ARCH COMMAND...: a command of Wine (wine, wineserver) for the prefix of x64 or x86.
wine_command() {
  local arch=$1
  shift
  # The locale decides which file names Wine can make.
  local settings=(LC_ALL=C.UTF-8 WINEDEBUG=-all "WINEPREFIX=$wine_home/$arch" "WINEDLLOVERRIDES=mscoree,mshtml=" "DISPLAY=${DISPLAY-}"
    "${wine_environment[@]}")
  case $arch in
    x64) timeout -k 10 "$wine_limit" env "${settings[@]}" WINEARCH=win64 "$@" <"$wine_input" ;;
    x86) in_wine32 "${settings[@]}" WINEARCH=win32 "$@" <"$wine_input" ;;
    *) die "no such architecture: $arch" ;;
  esac
}

# wine_run ARCH PROGRAM ARGUMENT...: a Windows program, in the checkout as current folder.
wine_run() {
  local arch=$1
  shift
  wine_command "$arch" wine "$@"
}

# Ends everything in the prefix; the registry is on disk afterwards.
wine_stop() {
  wine_command "$1" wineserver -k || true
  wine_command "$1" wineserver -w
}

# wine_prefix ARCH: makes the prefix when it is not there whole.
wine_prefix() {
  local arch=$1 prefix=$wine_home/$1
  [[ -e $prefix/complete ]] && return 0
  rm -rf "$prefix"
  mkdir -p "$wine_home"
  wine_run "$arch" wineboot -i
  # Absent in a fresh prefix, and an absent value is not the same as "no proxy" to the library.
  wine_run "$arch" reg add 'HKCU\Software\Microsoft\Windows\CurrentVersion\Internet Settings' /v ProxyEnable \
    /t REG_DWORD /d 0 /f
  # A crash shall end the program, not open a window that waits for someone.
  wine_run "$arch" reg add 'HKCU\Software\Wine\WineDbg' /v ShowCrashDialog /t REG_DWORD /d 0 /f
  wine_stop "$arch"
  touch "$prefix/complete"
}

# wine_trust ARCH AUTHORITY: programs in the prefix take the certificates of an authority, whose own is in a PEM file.
wine_trust() {
  local arch=$1 key='HKLM\Software\Microsoft\SystemCertificates\Root\Certificates' bytes name length
  bytes=$(openssl x509 -in "$2" -outform DER | od -An -v -tx1 | tr -d ' \n')
  name=$(openssl x509 -in "$2" -outform DER | sha1sum | cut -c -40)
  # A property of kind 32, a certificate; then 1 and the length of the bytes. Numbers begin with their low bytes.
  length=$(printf '%02x%02x0000' $((${#bytes} / 2 % 256)) $((${#bytes} / 512)))
  wine_run "$arch" reg add "$key\\${name^^}" /v Blob /t REG_BINARY /d "2000000001000000$length$bytes" /f
}

# registry_of ARCH FILE [ROOT]: what is registered for all users (HKLM) or, with HKCU, for the current one, as text.
registry_of() {
  wine_run "$1" reg export "${3-HKLM}\\Software\\Classes" "$2.utf16" /y
  iconv -f UTF-16 -t UTF-8 "$2.utf16" | tr -d '\r' >"$2"
}

# ---- The hosting server --------------------------------------------------------------------------------------------

# The account that demo and tests work with. Port 21 of the same address has an FTP server on its files.
hosting_address=127.0.0.21
hosting_user=anna.berg@example.org
hosting_password=Linden42
hosting_product=7

# start_hosting NAME ADDRESS DATA OPTION...: starts a hosting server with the account seeded; its "host:port", with
# "https://" before it over TLS, is left in `hosting_server`.
start_hosting() {
  local name=$1 address=$2 data=$3
  shift 3
  start_server "$name" '^listening on ' build/native/hosting/tarnwick-hosting --host "$address" --data "$data" \
    --seed-user "$hosting_user" --seed-password "$hosting_password" --seed-product "$hosting_product" \
    --seed-pictures demo/pictures "$@" || return 1
  hosting_server=${server_line#listening on }
}

start_ftp() {
  start_server "$1" '^listening on ' scripts/ftp-server "$hosting_address" 21 "$2" "$hosting_user" "$hosting_password"
}

# ---- The demo host -------------------------------------------------------------------------------------------------

# demo_folders FOLDER: what the demo host uploads, and where it downloads to.
demo_folders() {
  mkdir -p "$1/downloads" "$1/upload"
  # A name with a blank, which the account does not have yet.
  cp demo/pictures/deep-field.png "$1/upload/deep field.png"
}

# demo_host ARCH FOLDER LOG [SHOTS]: the host program. FOLDER is relative to the checkout, the others to FOLDER.
demo_host() {
  local arch=$1 folder=${2//\//\\}
  shift 2
  wine_run "$arch" "build\\windows-$arch\\demo\\host\\tarnwick-demo.exe" "$hosting_server" "$hosting_user" \
    "$hosting_password" "$hosting_product" "$folder\\upload" "$folder\\downloads" "${@/#/$folder\\}"
}

# demo_tour ARCH FOLDER NAME: the host program walks through all that it can do, with its log in FOLDER/events-NAME.log
# and a picture of each step in FOLDER/screenshots-NAME. It waits for each picture.
demo_tour() {
  local folder=$2 log=$2/events-$3.log shots=$2/screenshots-$3 host shown
  mkdir -p "$shots"
  demo_host "$1" "$folder" "events-$3.log" "screenshots-$3" &
  host=$!
  while kill -0 "$host" 2>/dev/null; do
    shown=$(sed -n 's/\r//; s/^== //p' "$log" 2>/dev/null | tail -n 1) || true
    if [[ -n $shown && ! -e $shots/$shown.png ]]; then
      import -window root "$folder/unfinished.png" || true
      mv "$folder/unfinished.png" "$shots/$shown.png" || true
    fi
    sleep 0.1
  done
  wait "$host"
  # The host does not wait for ever.
  for shown in $(sed -n 's/\r//; s/^== //p' "$log"); do [[ -s $shots/$shown.png ]]; done
}
