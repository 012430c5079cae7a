# Servers for tests over TLS, whose certificates are good, or bad in one way each, and what the network shows of TLS.
# Sourced, never run.

# certificate FOLDER NAME DAYS NAMES: FOLDER/NAME.pem with FOLDER/NAME.key, signed by FOLDER/authority.
certificate() {
  local at=$1/$2
  openssl req -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -subj "/CN=Tarnwick $2" -keyout "$at.key" -out "$at.request"
  openssl x509 -req -in "$at.request" -CA "$1/authority.pem" -CAkey "$1/authority.key" -CAcreateserial -days "$3" \
    -extfile <(printf '%s\n' 'basicConstraints=critical,CA:FALSE' 'extendedKeyUsage=serverAuth' "subjectAltName=$4") \
    -out "$at.pem"
}

# certificates FOLDER ADDRESS: an authority, and what it has signed for the address and for others.
certificates() {
  mkdir -p "$1"
  # A name of its own: programs find an authority by name, and may still trust that of an earlier run.
  openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -subj "/CN=Tarnwick tests $(date +%s)" -days 2 \
    -keyout "$1/authority.key" -out "$1/authority.pem"
  # An address stands among the names too, where Wine looks for it.
  certificate "$1" good 2 "IP:$2,DNS:$2,IP:::1,DNS:[::1]"
  certificate "$1" expired -1 "IP:$2,DNS:$2"
  certificate "$1" wrong-name 2 "DNS:pictures.example.org"
}

# start_tls_servers FOLDER ADDRESS OPTION...: starts them with the certificates in FOLDER, the one with faults with the
# options; `hosting_server` names one in the clear. Their variables for programs under Wine are left in
# `tls_environment`, and the one without faults in `secure_server`; who trusts the authority of FOLDER trusts all but
# TARNWICK_TLS_UNKNOWN.
start_tls_servers() {
  local folder=$1 address=$2 clear=$hosting_server variable kind own options listing users
  shift 2
  users=users/${hosting_user/example.org/example-org}
  listing="EstablishConnection=TRUE&UserAuthenticationStatus=TRUE"
  listing+="&FileName=coffee.jpg&FileURL=http://$clear/$users/coffee.jpg&FileSize=1&FileDate=d"
  tls_environment=()
  for variable in SERVER EXPIRED WRONG_NAME UNKNOWN STALL FAULTY_SERVER; do
    kind=${variable,,} own=good options=()
    case $variable in
      EXPIRED | WRONG_NAME) own=${kind/_/-} ;;
      STALL) options=(--fault '*=stall:handshake') ;;
      FAULTY_SERVER) options=("$@") ;;
    esac
    options+=(--tls-certificate "$folder/$own.pem" --tls-key "$folder/$own.key")
    [[ $variable != UNKNOWN ]] || options=(--tls-self-signed)
    start_hosting "hosting server with TLS, $kind" "$address" "$folder/$kind" "${options[@]}" || return 1
    tls_environment+=("TARNWICK_TLS_$variable=$hosting_server")
    if [[ $variable == SERVER ]]; then kind=rose secure_server=$hosting_server; fi
    listing+="&FileName=$kind.jpg&FileURL=$hosting_server/$users/$kind.jpg&FileSize=1&FileDate=d"
  done
  # One whose listing leads to all of them, and one that speaks no version of TLS that is safe.
  for variable in LISTING:TLSv1_2 OLD:TLSv1_1; do
    start_server "service with ${variable#*:}" '^listening on ' tests/windows/network.py answer "$address" "${variable#*:}" \
      "$folder/good.pem" "$folder/good.key" "$listing" || return 1
    tls_environment+=("TARNWICK_TLS_${variable%:*}=https://${server_line#listening on }")
  done
  # Of every machine with IPv6.
  grep -qs '^0*1 ' /proc/net/if_inet6 || return 0
  start_hosting "hosting server with IPv6" "[::1]" "$folder/ipv6" || return 1
  tls_environment+=("TARNWICK_IPV6=$hosting_server")
  start_hosting "hosting server with TLS and IPv6" "[::1]" "$folder/tls-ipv6" --tls-certificate "$folder/good.pem" \
    --tls-key "$folder/good.key" || return 1
  tls_environment+=("TARNWICK_TLS_IPV6=$hosting_server")
}

# over_tls ARCH PROGRAM ARGUMENT...: the same as wine_run, with the servers over TLS in place of the others.
over_tls() {
  wine_environment+=("${tls_environment[@]/#TARNWICK_TLS_/TARNWICK_}" "TARNWICK_SLOW=")
  wine_run "$@"
}

# record ARCH SERVER FILE: uses the account at the server, and keeps what the network carries meanwhile.
record() {
  local name=${2#https://}
  start_server "relay to $name" '^listening on ' tests/windows/network.py relay "${name%:*}" "$name" "$3"
  wine_environment+=("TARNWICK_SERVER=${2%"$name"}${server_line#listening on }")
  wine_run "$1" "build/windows-$1/tests/windows/com/tarnwick_com_tests.exe" \
    --gtest_filter='AnyControl/0.Uploads*:ThumbNailControl.ShowsPages*'
}

# wire ARCH: the network shows nothing of a session over TLS that it shows of one in the clear.
wire() (
  clear=build/wire-$1-clear secure=build/wire-$1-secure
  started=()
  trap 'stop_servers "${#started[@]}"' EXIT
  record "$1" "$hosting_server" "$clear"
  record "$1" "$secure_server" "$secure"
  secrets=("$hosting_user" "$hosting_password" rose.jpg @demo/pictures/rose.jpg)
  # As the log-on sends them.
  for field in UserName Password; do
    secrets+=("$(grep -a -o -m 1 "$field=[^&]*" "$clear" | sed 's/.*=//')")
  done
  [[ $(tests/windows/network.py found "$clear" "${secrets[@]}") == $(printf '%s\n' "${secrets[@]}") ]]
  tests/windows/network.py found "$secure" "${secrets[@]}" | tee "$secure-shows"
  [[ ! -s $secure-shows ]]
  # All of it went that way.
  (($(stat -c %s "$secure") > $(stat -c %s "$clear")))
)
