// Preloaded after the address sanitizer's runtime into the test servers
// of a sanitized build (test/PgServers.pm), for two faults of the runtimes in
// a server that was not built with them.
#include <cstddef>
#include <cstdlib>

extern "C" {

// The address sanitizer's runtime starts on the first call that it
// intercepts; in the server that is a malloc from a library's constructor
// that holds the C library's lock of message catalogues.  Starting, the
// runtime looks this name up, and the message of a failed look-up is
// translated under the same lock, which leaves the lock broken and the
// server hung at its next translation.  Found here, the look-up fails no
// more.  It is never called: it would demangle the names of another
// language in a report.
__attribute__((visibility("default"))) char *swift_demangle(const char * /*name*/,
                                                            std::size_t /*size*/, char * /*out*/,
                                                            std::size_t * /*outSize*/,
                                                            unsigned /*flags*/) {
  return nullptr;
}

// The undefined-behaviour sanitizer's runtime starts at its first report,
// in a backend, and reads its options from the process's first
// environment, which the server has written its process title over by
// then.  The C library's copy of the environment, which the server keeps,
// still has them, and the runtime asks here for its defaults.  The name is
// the runtime's.
// NOLINTNEXTLINE(bugprone-reserved-identifier,cert-dcl37-c,cert-dcl51-cpp)
__attribute__((visibility("default"))) const char *__ubsan_default_options() {
  const char *options = std::getenv("UBSAN_OPTIONS");
  return options != nullptr ? options : "";
}
}
