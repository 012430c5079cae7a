# Servers for tests over TLS, whose certificates are good, or bad in one way each. Sourced, never run.

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
  certificate "$1" good 2 "IP:$2,DNS:$2"
  certificate "$1" expired -1 "IP:$2,DNS:$2"
  certificate "$1" wrong-name 2 "DNS:pictures.example.org"
}

# start_tls_servers FOLDER ADDRESS OPTION...: starts them with the certificates in FOLDER, the one with faults with the
# options. Their variables for programs under Wine are left in `tls_environment`; who trusts the authority of FOLDER
# trusts all but TARNWICK_TLS_UNKNOWN.
start_tls_servers() {
  local folder=$1 address=$2 variable kind own options
  shift 2
  tls_environment=()
  for variable in SERVER EXPIRED WRONG_NAME UNKNOWN STALL FAULTY; do
    kind=${variable,,} own=good options=()
    case $variable in
      EXPIRED | WRONG_NAME) own=${kind/_/-} ;;
      STALL) options=(--fault '*=stall:handshake') ;;
      FAULTY) options=("$@") ;;
    esac
    options+=(--tls-certificate "$folder/$own.pem" --tls-key "$folder/$own.key")
    [[ $variable != UNKNOWN ]] || options=(--tls-self-signed)
    start_hosting "hosting server with TLS, $kind" "$address" "$folder/$kind" "${options[@]}" || return 1
    tls_environment+=("TARNWICK_TLS_$variable=$hosting_server")
  done
}
