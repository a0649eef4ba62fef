# shellcheck shell=bash
# Throwaway PostgreSQL servers for the extension's tests, sourced by the
# test scripts.  Nothing here touches the system's own PostgreSQL: the
# extension is installed into a private copy of the server's installation
# in a temporary folder, servers run there as an unprivileged user (the
# caller, or the account `postgres` when the caller is root) and listen on
# a Unix socket in that folder, or on 127.0.0.1 when asked, and every
# server is stopped when the script ends, also when it fails.
#
#   pg_setup BUILD-FOLDER   make the installation (sets PG_WORK and PG_BIN)
#   pg_setup --system       use the system's installation as it is, where
#                           the extension's package has been installed
#   pg_start NAME [PORT]    initdb and start a server; PORT: listen on
#                           127.0.0.1 too (sets PG_PORT_<NAME>)
#   as_server CMD...        run CMD as the servers' user
#   pg_sql NAME SQL         run SQL in the server's database postgres
#   pg_cleanup              stop every server and remove the folder

PG_SERVERS=()

as_server() {
  if (($(id -u) == 0)); then
    runuser -u postgres -- "$@"
  else
    "$@"
  fi
}

pg_cleanup() {
  local name
  for name in "${PG_SERVERS[@]}"; do
    as_server "$PG_BIN/pg_ctl" -D "$PG_WORK/$name" -m immediate stop >/dev/null 2>&1 || true
  done
  [[ -n ${PG_WORK:-} ]] && rm -rf "$PG_WORK"
}

pg_setup() {
  local build=$1 system_bin system_lib system_share root entry
  PG_WORK=$(mktemp -d "${TMPDIR:-/tmp}/orvclifn-pg.XXXXXX")
  chmod 755 "$PG_WORK"
  (($(id -u) == 0)) && chown postgres "$PG_WORK"
  trap pg_cleanup EXIT
  if [[ $build == --system ]]; then
    PG_BIN=/usr/lib/postgresql/15/bin
    as_server mkdir -p "$PG_WORK/socket"
    return 0
  fi
  system_bin=$(sed -n 's/^ORV_PG_CONFIG:FILEPATH=//p' "$build/CMakeCache.txt")
  [[ -x $system_bin ]] || { echo "no pg_config in the build's cache" >&2; return 1; }
  system_lib=$("$system_bin" --pkglibdir)
  system_share=$("$system_bin" --sharedir)
  system_bin=$("$system_bin" --bindir)
  root=$PG_WORK/install

  # The server finds its share and lib folders relative to its program,
  # so a copy of the programs in a tree shaped like the system's finds the
  # extension installed into that tree.
  cmake --install "$build" --prefix "$root/usr" --component runtime >/dev/null
  cmake --install "$build" --prefix "$root/usr" --component postgres >/dev/null
  PG_BIN=$root/${system_bin#/}
  mkdir -p "$PG_BIN" "$root/${system_share#/}/extension" "$root/${system_lib#/}"
  for entry in postgres initdb pg_ctl; do cp "$system_bin/$entry" "$PG_BIN/"; done
  ln -s "$system_bin/psql" "$PG_BIN/psql"
  for entry in "$system_share"/*; do
    [[ $(basename "$entry") == extension ]] || ln -s "$entry" "$root/${system_share#/}/"
  done
  # Ours were installed first and stay, also where the system has its own.
  for entry in "$system_share"/extension/* "$system_lib"/*; do
    local into=$root/${system_lib#/}
    [[ $entry == "$system_share"/* ]] && into=$root/${system_share#/}/extension
    [[ -e $into/$(basename "$entry") ]] || ln -s "$entry" "$into/"
  done
  as_server mkdir -p "$PG_WORK/socket"
  return 0
}

pg_start() {
  local name=$1 port=${2:-} data=$PG_WORK/$1 listen=""
  # On a socket alone the port only names the socket file.
  [[ -n $port ]] && listen=127.0.0.1
  port=${port:-$((15432 + ${#PG_SERVERS[@]}))}
  as_server mkdir -p "$data"
  as_server "$PG_BIN/initdb" -D "$data" -U postgres -A trust -E UTF8 --locale=C.UTF-8 \
    --no-sync >"$PG_WORK/$name.initdb.log" 2>&1 ||
    { cat "$PG_WORK/$name.initdb.log" >&2; return 1; }
  cat >>"$data/postgresql.conf" <<EOF
listen_addresses = '$listen'
port = $port
unix_socket_directories = '$PG_WORK/socket'
fsync = off
max_parallel_workers_per_gather = 2
EOF
  PG_SERVERS+=("$name")
  as_server "$PG_BIN/pg_ctl" -D "$data" -l "$PG_WORK/$name.log" -w start >/dev/null ||
    { cat "$PG_WORK/$name.log" >&2; return 1; }
  printf -v "PG_PORT_$name" '%s' "$port"
}

pg_port() { local v="PG_PORT_$1"; echo "${!v}"; }

pg_sql() {
  as_server "$PG_BIN/psql" -X -q -v ON_ERROR_STOP=1 -h "$PG_WORK/socket" -p "$(pg_port "$1")" \
    -U postgres -d postgres -At -c "$2"
}
