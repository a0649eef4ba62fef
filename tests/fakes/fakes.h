// A fake set of the engine's services, linked into a copy of the library in
// place of the stand-ins, so that tests can make each service fail and see
// what the routines handed it.  orv_fakes() gives the one control block;
// orv_fakes_reset() puts it back to services that succeed.
#pragma once

#include <cstdint>

#include "engine/services.h"

struct OrvFakes {
  // Name services: the length they return (0 fails) and the bytes, in UTF-8.
  std::uint8_t nameLength;
  unsigned char name[256];
  CLI_nlsTimeRecord lastTime;
  std::uint32_t lastNameSize;
  // sqlocpcv: copies up to `convertBytes` source bytes (all when -1) and
  // returns `convertStatus`; what it was given is kept.
  std::int32_t convertStatus, convertBytes;
  int convertCalls;
  CLI_conversionRecord lastRecord;  // as it was handed in
  std::uint32_t lastSourceCodePage, lastTargetCodePage;
  std::int32_t encodingClass;  // sqlnls_Encoding2
  // sqlnlsCollIDMapIDToName: returns collationLength after copying "NAME".
  std::int32_t collationLength;
  int collationCalls;
  std::uint32_t lastCollationSize;
  // Number text: what sqlrxa2f gives, and the text sqlrxf2a writes.
  std::int32_t a2fStatus;
  double a2fValue;
  std::uint32_t lastA2fLength;
  char rawText[23];
  // Snapshot services: real file reads on `instancePath`, with failures.
  std::int32_t instanceStatus;
  char instancePath[264];
  std::int32_t allocationStatus;
  char logMessage[128];
  // The services asked, in order: "s" the static data, "o" open, "rN" a
  // read of N bytes, "mN" a move by N, "aN" a block of N bytes, "f" a free,
  // "lS" a log line with status S, "c" a close; blank-separated.
  char trace[4096];
};

extern "C" CLI_SERVICE_API OrvFakes *orv_fakes();
extern "C" CLI_SERVICE_API void orv_fakes_reset();

#if defined(ORV_FAKE_SERVICES_PATH)
#include "support/platform.hpp"

// For the tests: the control block, reset; null when the fake services
// can't be loaded.  It is the fake services' own, found in their file, not
// in the library linked to them.
inline OrvFakes *orvFreshFakes() {
  void *services = orv::test::openLibrary(ORV_FAKE_SERVICES_PATH);
  if (services == nullptr) return nullptr;
  reinterpret_cast<void (*)()>(orv::test::findExport(services, "orv_fakes_reset"))();
  return reinterpret_cast<OrvFakes *(*)()>(orv::test::findExport(services, "orv_fakes"))();
}
#endif
