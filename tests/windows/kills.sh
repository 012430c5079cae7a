#!/bin/bash
# Kills a host in the middle of its transfers, again and again: every file under a name of its own must be whole, and
# what was being written must be gone once the next host has logged on and downloaded a picture.
#
#   tests/windows/kills.sh [COUNT]    60 kills, or COUNT, under 64-bit Wine, with what scripts/test has built

# kills ARCH COUNT: in a prefix where the library is registered.
kills() (
  arch=$1 count=$2 work=build/kills-$1 kinds=(upload download thumbnails) among=0
  account=${hosting_user/example.org/example-org}
  user_folder=$wine_home/$arch/drive_c/users/$(id -un)/Temp/bv/$account
  folders=("$work/downloads" "$user_folder")
  rm -rf "$work" "$user_folder"
  mkdir -p "$work/pictures" "${folders[@]}"
  # Large ones take long to write, the slow one comes byte by byte.
  for picture in large:40000000 slow:300000 small:1000 upload:40000000; do
    head -c "${picture#*:}" /dev/urandom >"$work/pictures/${picture%:*}.jpg"
  done
  started=()
  trap 'stop_servers "${#started[@]}"' EXIT
  start_hosting "hosting server for kills $arch" 127.0.0.1 "$work/data" --quota 1000000000 \
    --fault "/users/$account/slow.jpg=drip:0" --seed-pictures "$work/pictures"

  for ((i = 0; i <= count; i++)); do
    # All but the small one is fetched anew. The user's folder has that one, so nothing is written there before "ready".
    rm -f "$user_folder"/{large,slow,upload}.jpg
    # As the end of a machine leaves it.
    for folder in "${folders[@]}"; do echo half >"$folder/twkfffffff0-1-1.tmp"; done
    mapfile -t leftovers < <(find "${folders[@]}" -name '*.tmp')
    : >"$work/host.log"
    wine_run "$arch" cscript //nologo 'tests\windows\kills.vbs' "$hosting_server" "$hosting_user" "$hosting_password" \
      "$hosting_product" "${kinds[i % 3]}" "${work//\//\\}\\downloads" "${work//\//\\}\\pictures\\upload.jpg" \
      >"$work/host.log" &
    started+=($!)
    for ((j = 0; j < 1000; j++)); do
      ! grep -q ready "$work/host.log" || break
      sleep 0.02
    done
    for folder in "${folders[@]}"; do cmp "$folder/small.jpg" "$work/pictures/small.jpg"; done
    for file in "${leftovers[@]}"; do [[ ! -e $file ]] || die "left over: $file"; done
    ((i < count)) || break

    host=${started[-1]}
    while child=$(pgrep -o -P "$host"); do host=$child; done
    # Moments of the first second and a half, no two the same.
    sleep "$((i * 618 % 1500))e-3"
    kill -STOP "$host"
    [[ -z $(find "${folders[@]}" -name '*.tmp') ]] || among=$((among + 1))
    kill -KILL "$host"
    wait "${started[-1]}" || true
    unset 'started[-1]'
    for file in "$work"/downloads/*.jpg "$user_folder"/*.jpg "$work"/data/users/*/*.jpg; do
      cmp "$file" "$work/pictures/${file##*/}"
    done
  done
  echo "$count kills, $among of them while a file was being written"
  # Else it has shown nothing.
  ((among > 0))
)

if [[ ${BASH_SOURCE[0]} == "$0" ]]; then
  . "${0%/*}/../../scripts/lib.sh"
  wine_home=$build/wine/kills
  start_display
  step "Wine prefix" wine_prefix x64
  step "register Tarnwick.ocx" wine_run x64 regsvr32 /s build/windows-x64/Tarnwick.ocx
  step "kills" kills x64 "${1-60}"
  tail -n 1 "$logs/kills.log"
fi
