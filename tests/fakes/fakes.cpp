// The fake services: each does the least that lets a routine go on, fails
// where the control block says, and keeps what it was handed.
#include "fakes/fakes.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>

#include "elements.hpp"
#include "files.hpp"

namespace {

OrvFakes fakes;

// The chain from the static data to the snapshot name "cache".
struct StaticData {
  alignas(8) unsigned char head[96];
  alignas(8) unsigned char p[8];
  alignas(8) unsigned char q[120];
  alignas(8) unsigned char r[26408 + 16];
};
StaticData chain;

uint8_t name(const CLI_nlsTimeRecord *time, uint32_t size, unsigned char *out, uint16_t *codePage) {
  fakes.lastTime = *time;
  fakes.lastNameSize = size;
  std::memcpy(out, fakes.name, std::min<std::size_t>(fakes.nameLength, size));
  *codePage = 1208;
  return fakes.nameLength;
}

// Adds one entry to the trace of the services asked; a trace that would
// pass its 4096 bytes is cut.
void trace(char kind, std::optional<long long> value = {}) {
  const std::size_t used = std::strlen(fakes.trace);
  const std::string entry = (used == 0 ? std::string() : std::string(" ")) + kind +
                            (value ? std::to_string(*value) : std::string());
  static_cast<void>(
      std::snprintf(fakes.trace + used, sizeof fakes.trace - used, "%s", entry.c_str()));
}

}  // namespace

extern "C" {

OrvFakes *orv_fakes() { return &fakes; }

void orv_fakes_reset() {
  fakes = OrvFakes{};
  fakes.nameLength = 6;
  std::memcpy(fakes.name, "Sunday", 6);
  fakes.convertBytes = -1;
  fakes.encodingClass = 1;
  fakes.collationLength = 4;
  std::memcpy(fakes.rawText, "+1.50000000000000E+000", 23);
}

int32_t sqlocpcv(const unsigned char **source, uint32_t length, uint32_t from, uint32_t to, int32_t,
                 CLI_conversionRecord *record, int32_t *) {
  ++fakes.convertCalls;
  fakes.lastRecord = *record;
  fakes.lastSourceCodePage = from;
  fakes.lastTargetCodePage = to;
  uint32_t n = fakes.convertBytes < 0 ? length : static_cast<uint32_t>(fakes.convertBytes);
  n = std::min(n, record->space);
  std::memcpy(record->target, *source, std::min(n, length));
  record->space -= n;
  return fakes.convertStatus;
}

uint8_t sqloNLSGetServerMonthName(const CLI_nlsTimeRecord *t, uint32_t size, unsigned char *out,
                                  uint16_t *cp) {
  return name(t, size, out, cp);
}
uint8_t sqloNLSGetServerDayName(const CLI_nlsTimeRecord *t, uint32_t size, unsigned char *out,
                                uint16_t *cp) {
  return name(t, size, out, cp);
}

int32_t sqlrxa2f(const char *, uint32_t length, double *value, uint32_t) {
  fakes.lastA2fLength = length;
  if (fakes.a2fStatus == 0) *value = fakes.a2fValue;
  return fakes.a2fStatus;
}

int32_t sqlrxf2a(const double *, int32_t, char *text, uint32_t) {
  std::memcpy(text, fakes.rawText, 23);
  return 0;
}

int32_t sqlnlsCollIDMapIDToName(char *out, uint32_t size, const unsigned char *, int32_t) {
  ++fakes.collationCalls;
  fakes.lastCollationSize = size;
  std::memset(out, 0, size);  // all that it was told it may write
  std::memcpy(out, "NAME", std::min<std::size_t>(4, size));
  return fakes.collationLength;
}

void *sqlo_get_static_data(void) {
  trace('s');
  const void *p = chain.p, *q = chain.q, *r = chain.r;
  std::memcpy(chain.head + 88, &p, sizeof p);
  std::memcpy(chain.p, &q, sizeof q);
  std::memcpy(chain.q + 112, &r, sizeof r);
  std::memcpy(chain.r + 26408, "cache", 6);
  return chain.head;
}

int32_t sqleinstancepath(int32_t, char *path) {
  std::memcpy(path, fakes.instancePath, sizeof fakes.instancePath);
  return fakes.instanceStatus;
}

// The files are the stand-in's; the fakes count and fail.
int32_t sqloopenp(const char *path, int32_t, int32_t, CLI_fileHandle *handle, int32_t) {
  const int32_t status = orv::standin::openFile(path, handle);
  if (status == 0) trace('o');
  return status;
}

// Stores the bytes read through its last argument, as the engine's service
// does, so a caller that hands it no word is caught.
int32_t sqloread(CLI_fileHandle handle, void *out, uint32_t count, uint32_t *read) {
  *read = 0;
  trace('r', count);
  return orv::standin::readFile(handle, out, count, read);
}

int32_t sqlochgfileptr(CLI_fileHandle handle, int64_t offset, int32_t origin, int32_t) {
  trace('m', offset);
  return orv::standin::moveIn(handle, offset, origin);
}

int32_t sqloclose(CLI_fileHandle handle) {
  trace('c');
  return orv::standin::closeFile(handle);
}

int32_t sqlogmblkEx(void *, uint64_t size, int32_t, void **block, const char *, int32_t, int32_t) {
  trace('a', static_cast<long long>(size));
  if (fakes.allocationStatus != 0) return fakes.allocationStatus;
  *block = std::malloc(size == 0 ? 1 : size);
  return *block == nullptr ? 1 : 0;
}

int32_t sqlofmblkEx(const char *, int32_t, void *block) {
  trace('f');
  std::free(block);
  return 0;
}

void sqlt_logerr_data(const char *message, const void *data, int32_t size, int32_t) {
  static_cast<void>(std::snprintf(fakes.logMessage, sizeof fakes.logMessage, "%s", message));
  int32_t status = 0;
  if (size == 4) std::memcpy(&status, data, 4);
  trace('l', status);
}

void sqlm_filter_file_name(char *) {}

const sqlm_header_info *sqlm_find_element(uint32_t element, const sqlm_header_info *parent) {
  return orv::standin::findElement(element, parent);
}

int32_t sqlnls_Encoding2(uint32_t, int32_t) { return fakes.encodingClass; }

}  // extern "C"
