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
#   pg_launch NAME          start the server of an initialised folder
#   as_server CMD...        run CMD as the servers' user
#   pg_sql NAME SQL         run SQL in the server's database postgres
#   pg_cleanup              stop every server and remove the folder

PG_SERVERS=()

# The build of the asan preset has the module, the library and the service
# libraries built with the address and undefined-behaviour sanitizers; the
# server is not.  The address sanitizer's runtime must be the first object
# of a process that loads an instrumented one, so every server gets it by
# LD_PRELOAD: the postmaster, and every backend that forks from it; with
# it test/sanitizer_hooks.cpp, without which the runtimes hang the server
# or lose their options.  Leak checking is off, as the processes'
# allocations are the server's, let go when they exit.  An address report
# goes to a file of its process, an undefined-behaviour one to the
# server's log, and pg_cleanup fails the script on any: see pg_reports.
PG_CHECK_ENV=()
PG_SOURCES=$(cd "$(dirname "${BASH_SOURCE[0]}")/../../.." && pwd)

pg_checker() {
  local build=$1 asan log=$PG_WORK/sanitizer/report hooks=$PG_WORK/orv_pg_sanitizer_hooks.so
  grep -q '^ORV_SANITIZE:STRING=.*address' "$build/CMakeCache.txt" || return 0
  # The runtime that the module was linked with.
  asan=$(ldd "$build/lib/postgresql/orvclifn.so" | awk '$1 ~ /^libasan\.so/ { print $3 }')
  [[ -n $asan ]] || { echo "the sanitized module names no ASan runtime" >&2; return 1; }
  cp "$build/lib/orv_pg_sanitizer_hooks.so" "$hooks"
  chmod a+r "$hooks"
  as_server mkdir -p "$PG_WORK/sanitizer"
  # The same log_path for both: the undefined-behaviour runtime hands its
  # own to the address runtime, whose functions come first.
  PG_CHECK_ENV=("LD_PRELOAD=$asan:$hooks" "ASAN_OPTIONS=detect_leaks=0:log_path=$log"
    "UBSAN_OPTIONS=print_stacktrace=1:log_path=$log")
}

# Prints every sanitizer report of the servers; false when there is one.
# Each fails the run.  PostgreSQL's code is not instrumented, so a report
# comes from our objects, or from the address runtime's checks of the C
# library's and the allocator's functions as the server calls them.  None
# is suppressed, so none of the server's can hide one of ours; the label
# tells them apart by the frames: one in the module, the library or the
# service libraries (by file name, or by a source of this tree) makes it
# ours.
pg_reports() {
  local report text who status=0
  for report in "$PG_WORK"/sanitizer/report.* "$PG_WORK"/*.log; do
    [[ -e $report ]] || continue
    # From a server log, the lines of the runtimes: from one that names a
    # sanitizer or a runtime error to the server's next line of its own.
    text=$(awk '/runtime error:|Sanitizer/ { on = 1 } /^[0-9]{4}-[0-9]{2}-[0-9]{2} / { on = 0 } on' \
      "$report")
    [[ $report == */sanitizer/* ]] && text=$(cat "$report")
    [[ -n $text ]] || continue
    status=1
    who="PostgreSQL's own code: no frame of ours"
    if grep -qE "orvclifn\.so|liborvclifn\.so|libORV(SYS|APP|G11N)64\.so" <<<"$text" ||
      grep -qF "$PG_SOURCES/" <<<"$text"; then
      who="the module or the library"
    fi
    echo "sanitizer report in $(basename "$report"), from $who:" >&2
    echo "$text" >&2
  done
  return "$status"
}

as_server() {
  if (($(id -u) == 0)); then
    runuser -u postgres -- "$@"
  else
    "$@"
  fi
}

pg_cleanup() {
  local status=0 name
  for name in "${PG_SERVERS[@]}"; do
    as_server "$PG_BIN/pg_ctl" -D "$PG_WORK/$name" -m immediate stop >/dev/null 2>&1 || true
  done
  [[ -n ${PG_WORK:-} ]] && { pg_reports || status=1; rm -rf "$PG_WORK"; }
  ((status == 0)) || exit 1
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
  pg_checker "$build"
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
  pg_launch "$name" || { cat "$PG_WORK/$name.log" >&2; return 1; }
  printf -v "PG_PORT_$name" '%s' "$port"
}

pg_launch() {
  as_server env "${PG_CHECK_ENV[@]}" "$PG_BIN/pg_ctl" -D "$PG_WORK/$1" -l "$PG_WORK/$1.log" \
    -w start >/dev/null
}

pg_port() { local v="PG_PORT_$1"; echo "${!v}"; }

pg_sql() {
  as_server "$PG_BIN/psql" -X -q -v ON_ERROR_STOP=1 -h "$PG_WORK/socket" -p "$(pg_port "$1")" \
    -U postgres -d postgres -At -c "$2"
}
