// The engine's side of the table functions, as a PostgreSQL server plays
// it: the instance path that SQLCACHE_SNAPSHOT reads under, and the tables
// that FmpThreads and FmpRows ask their callback for.
//
//  - FmpThreads: one row per server process, from the server's activity
//    table: process id, database OID, role OID, process type (PostgreSQL's
//    BackendType number), state (its BackendState number, or -1 where the
//    caller may not see it, as in pg_stat_activity) and the start of the
//    process in seconds since 1970.  Selector 0 gives every process, any
//    other value the process with that id.
//  - FmpRows: one row per table, partitioned table and materialized view
//    of the current database, from pg_class: OID, pages, columns, kind,
//    persistence (both as the code of their letter) and whether it has an
//    index (1 or 0).
#include "server.hpp"
// server.hpp first: PostgreSQL's headers want to come before any other.
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "fmp_tables.hpp"
#include "tables.hpp"

extern "C" {
#include "catalog/pg_authid_d.h"
#include "executor/spi.h"
#include "utils/acl.h"
#include "utils/backend_status.h"
#include "utils/guc.h"
}

namespace orv::pg {
namespace {

using orv::standin::requestField;

char *gInstancePath = nullptr;     // the setting
char *gEnvironmentPath = nullptr;  // ORVENGINE_INSTANCE_PATH as the server started
constexpr const char *kInstanceVariable = "ORVENGINE_INSTANCE_PATH";

// A table of fixed-size row records, as the callback hands it out.
struct Records {
  unsigned char *data = nullptr;
  std::int32_t count = 0;
};
constexpr std::size_t kThreadRecord = 28, kRowRecord = 16;
Records gThreads, gRows;
// The table that the callback handed out for the selector of an open
// request, until the close request gives it back.
unsigned char *gSelected = nullptr;

void put32(unsigned char *at, std::int32_t v) { std::memcpy(at, &v, sizeof v); }
void put16(unsigned char *at, std::int16_t v) { std::memcpy(at, &v, sizeof v); }

Records serverProcesses() {
  const int count = pgstat_fetch_stat_numbackends();
  Records out;
  out.data = static_cast<unsigned char *>(
      palloc0(kThreadRecord * static_cast<std::size_t>(count > 0 ? count : 1)));
  const bool allStats = has_privs_of_role(GetUserId(), ROLE_PG_READ_ALL_STATS);
  for (int id = 1; id <= count; ++id) {
    const LocalPgBackendStatus *local = pgstat_fetch_stat_local_beentry(id);
    if (local == nullptr) continue;
    const PgBackendStatus &b = local->backendStatus;
    const bool visible = allStats || has_privs_of_role(GetUserId(), b.st_userid);
    unsigned char *row = out.data + kThreadRecord * static_cast<std::size_t>(out.count++);
    put32(row + 4, b.st_procpid);
    put32(row + 8, static_cast<std::int32_t>(b.st_databaseid));
    put32(row + 12, static_cast<std::int32_t>(b.st_userid));
    put32(row + 16, static_cast<std::int32_t>(b.st_backendType));
    put32(row + 20, visible ? static_cast<std::int32_t>(b.st_state) : -1);
    const TimestampTz start = b.st_proc_start_timestamp;
    constexpr std::int64_t kEpochShift =
        std::int64_t{POSTGRES_EPOCH_JDATE - UNIX_EPOCH_JDATE} * SECS_PER_DAY;
    put32(row + 24, static_cast<std::int32_t>(start / USECS_PER_SEC + kEpochShift));
  }
  return out;
}

Records databaseTables() {
  Records out;
  if (SPI_connect() != SPI_OK_CONNECT) ereport(ERROR, (errmsg("orvclifn: SPI_connect failed")));
  const int rc = SPI_execute(
      "SELECT c.oid, c.relpages, c.relnatts, c.relkind, c.relpersistence, c.relhasindex "
      "FROM pg_catalog.pg_class c WHERE c.relkind IN ('r', 'p', 'm') ORDER BY c.oid",
      true, 0);
  if (rc != SPI_OK_SELECT) ereport(ERROR, (errmsg("orvclifn: reading pg_class failed")));
  const auto count = static_cast<std::size_t>(SPI_processed);
  // In the caller's memory, which outlives SPI_finish.
  out.data = static_cast<unsigned char *>(SPI_palloc(kRowRecord * (count > 0 ? count : 1)));
  for (std::size_t i = 0; i < count; ++i) {
    HeapTuple tuple = SPI_tuptable->vals[i];
    TupleDesc desc = SPI_tuptable->tupdesc;
    bool null = false;
    unsigned char *row = out.data + kRowRecord * i;
    put32(row, static_cast<std::int32_t>(DatumGetObjectId(SPI_getbinval(tuple, desc, 1, &null))));
    put32(row + 4, DatumGetInt32(SPI_getbinval(tuple, desc, 2, &null)));
    put16(row + 8, DatumGetInt16(SPI_getbinval(tuple, desc, 3, &null)));
    put16(row + 10, static_cast<std::int16_t>(DatumGetChar(SPI_getbinval(tuple, desc, 4, &null))));
    // The last two are single bytes.
    row[12] = static_cast<unsigned char>(DatumGetChar(SPI_getbinval(tuple, desc, 5, &null)));
    row[13] = DatumGetBool(SPI_getbinval(tuple, desc, 6, &null)) ? 1 : 0;
  }
  out.count = static_cast<std::int32_t>(count);
  SPI_finish();
  return out;
}

}  // namespace

void defineSettings() {
  if (const char *path = std::getenv(kInstanceVariable)) {
    gEnvironmentPath = MemoryContextStrdup(TopMemoryContext, path);
  }
  // Only a superuser may point the server at another folder to read.
  DefineCustomStringVariable(
      "orvclifn.instance_path",
      "Instance path under which sqlcache_snapshot() reads tmp/<snapshot name>.sql.",
      "Empty: the environment variable ORVENGINE_INSTANCE_PATH of the server.", &gInstancePath, "",
      PGC_SUSET, 0, nullptr, nullptr, nullptr);
  MarkGUCPrefixReserved("orvclifn");
}

void prepareEngine() {
  // The engine's services read the instance path from the environment.
  const char *path =
      gInstancePath != nullptr && gInstancePath[0] != '\0' ? gInstancePath : gEnvironmentPath;
  if (path != nullptr) {
    setenv(kInstanceVariable, path, 1);
  } else {
    unsetenv(kInstanceVariable);
  }
  gThreads = serverProcesses();
  gRows = databaseTables();
  gSelected = nullptr;
}

void releaseEngine() {
  gThreads = {};
  gRows = {};
  gSelected = nullptr;
}

std::int32_t engineCallback(std::int32_t /*slots*/, void *request) {
  auto *slot = static_cast<std::uint64_t *>(request);
  const std::int32_t code = *requestField(slot[0]);
  if (code == 1) {  // close: the table comes back
    gSelected = nullptr;
    return 0;
  }
  if (code == 2) {  // open FmpRows
    *requestField(slot[1]) = gRows.count;
    std::memcpy(&slot[2], &gRows.data, sizeof gRows.data);
    return 0;
  }
  if (code != 3) return -1;
  // open FmpThreads: the rows of the selected processes, moved to the front
  // of the prepared table, which is the host's to reorder.
  const std::int32_t selector = *requestField(slot[1]);
  std::int32_t kept = 0;
  for (std::int32_t i = 0; i < gThreads.count; ++i) {
    unsigned char *row = gThreads.data + kThreadRecord * static_cast<std::size_t>(i);
    std::int32_t pid = 0;
    std::memcpy(&pid, row + 4, sizeof pid);
    if (selector != 0 && pid != selector) continue;
    std::memmove(gThreads.data + kThreadRecord * static_cast<std::size_t>(kept++), row,
                 kThreadRecord);
  }
  gSelected = gThreads.data;
  *requestField(slot[2]) = kept;
  std::memcpy(&slot[3], &gSelected, sizeof gSelected);
  return kept == 0 ? -3 : 0;
}

Datum columnValue(FunctionCallInfo fcinfo, const cli::catalogue::Slot &slot, const void *area) {
  namespace cat = cli::catalogue;
  switch (slot.layout) {
    case cat::Layout::int16: {
      std::int16_t v = 0;
      std::memcpy(&v, area, sizeof v);
      return Int16GetDatum(v);
    }
    case cat::Layout::int32: {
      std::int32_t v = 0;
      std::memcpy(&v, area, sizeof v);
      return Int32GetDatum(v);
    }
    case cat::Layout::text: {
      const auto *text = static_cast<const char *>(area);
      return PointerGetDatum(resultText(fcinfo, text, ::strnlen(text, slot.size)));
    }
    case cat::Layout::lob: {
      std::uint32_t length = 0;
      std::memcpy(&length, area, sizeof length);
      if (length > slot.size) length = slot.size;
      return PointerGetDatum(
          resultText(fcinfo, static_cast<const char *>(area) + CLI_LOB_DATA_OFFSET, length));
    }
    default:
      ereport(ERROR, (errmsg("orvclifn: a table column of a layout that the host does not know")));
  }
  pg_unreachable();
}

}  // namespace orv::pg
