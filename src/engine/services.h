/*
 * services.h - the engine's closed services that the routines call, with
 * the signatures the routines call them by.
 *
 * They live in three libraries of the engine: ORVSYS64 (operating system,
 * national language and number services), ORVAPP64 (monitor elements) and
 * ORVG11N64 (encodings).  The library links against them as it would
 * against the engine's own; standin/ holds small libraries of the same
 * names that implement them for use outside the engine.
 *
 * Plain C: the services are C functions with undecorated names.
 */
#ifndef ORVCLIFN_ENGINE_SERVICES_H
#define ORVCLIFN_ENGINE_SERVICES_H

/* NOLINTBEGIN(modernize-deprecated-headers, modernize-use-using): plain C */
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* Marks a service.  On Windows the libraries that provide the services
 * (built with CLI_SERVICE_BUILD) export them; the library imports them by
 * name through their import libraries. */
#if defined(_WIN32) && defined(CLI_SERVICE_BUILD)
#define CLI_SERVICE_API __declspec(dllexport)
#elif defined(_WIN32)
#define CLI_SERVICE_API
#else
#define CLI_SERVICE_API __attribute__((visibility("default")))
#endif

/* ---- Records that cross the boundary --------------------------------- */

/*
 * The record of a code page conversion, 32 bytes.  The caller sets the
 * target and the space, and the fixed values; the service lowers the space
 * by the bytes that it writes.
 */
typedef struct CLI_conversionRecord {
  unsigned char reserved0[8]; /* 0: not written by the caller */
  unsigned char *target;      /* 8: where the converted bytes go */
  uint32_t space;             /* 16: bytes free at the target */
  uint16_t fixed20;           /* 20: 0 */
  unsigned char reserved22[2];
  uint8_t fixed24;  /* 24: 0 */
  uint8_t fixed25;  /* 25: 0 */
  uint8_t fixed26;  /* 26: 1 */
  uint8_t fixed27;  /* 27: 1 */
  uint8_t fixed28;  /* 28: 1 */
  uint8_t fixed29;  /* 29: 0 */
  uint16_t fixed30; /* 30: 0xFFFF */
} CLI_conversionRecord;

/* A broken-down time in the layout of the C library's struct tm: nine
 * 32-bit fields, of which the name services read the month (offset 16)
 * and the day of the week (offset 24). */
typedef struct CLI_nlsTimeRecord {
  int32_t second, minute, hour, dayOfMonth, month, year, dayOfWeek, dayOfYear, isDst;
} CLI_nlsTimeRecord;

/* An open file, opaque to the routines: 16 bytes, passed by value. */
typedef struct CLI_fileHandle {
  unsigned char bytes[16];
} CLI_fileHandle;

/* The header of a monitor element: its data follows at once. */
typedef struct sqlm_header_info {
  uint32_t size;    /* data bytes behind the header */
  uint16_t type;    /* not read */
  uint16_t element; /* element identifier */
} sqlm_header_info;

/* ---- ORVSYS64 --------------------------------------------------------- */

/* Converts sourceLength bytes at *source from one code page to another
 * into record->target, lowering record->space by the bytes written.
 * 0 on success; see the callers for what counts as failure. */
CLI_SERVICE_API int32_t sqlocpcv(const unsigned char **source, uint32_t sourceLength,
                                 uint32_t sourceCodePage, uint32_t targetCodePage, int32_t flags,
                                 CLI_conversionRecord *record, int32_t *work);

/* The server's full name of record->month or record->dayOfWeek: up to
 * size bytes into name, with their code page.  Returns the length, 0 on
 * failure. */
CLI_SERVICE_API uint8_t sqloNLSGetServerMonthName(const CLI_nlsTimeRecord *time, uint32_t size,
                                                  unsigned char *name, uint16_t *codePage);
CLI_SERVICE_API uint8_t sqloNLSGetServerDayName(const CLI_nlsTimeRecord *time, uint32_t size,
                                                unsigned char *name, uint16_t *codePage);

/* Text to an 8-byte double; 0 when the text is a number. */
CLI_SERVICE_API int32_t sqlrxa2f(const char *text, uint32_t length, double *value,
                                 uint32_t valueSize);
/* A double as raw number text: sign, digit, point, 14 digits, 'E', sign,
 * three exponent digits, NUL (23 bytes). */
CLI_SERVICE_API int32_t sqlrxf2a(const double *value, int32_t digits, char *text,
                                 uint32_t valueSize);

/* The name of a collation identifier of 8 bytes: its length, 0 if unknown. */
CLI_SERVICE_API int32_t sqlnlsCollIDMapIDToName(char *name, uint32_t size,
                                                const unsigned char *identifier, int32_t flags);

/* The process's static data, where the chain to the snapshot name starts. */
CLI_SERVICE_API void *sqlo_get_static_data(void);
/* The instance path, terminated, into an area of 264 bytes; 0 on success. */
CLI_SERVICE_API int32_t sqleinstancepath(int32_t flags, char *path);

/* Files: opened for reading; 0 on success.  sqloread fails on a short read. */
CLI_SERVICE_API int32_t sqloopenp(const char *path, int32_t mode, int32_t permissions,
                                  CLI_fileHandle *handle, int32_t flags);
CLI_SERVICE_API int32_t sqloread(CLI_fileHandle handle, void *destination, uint32_t count,
                                 uint32_t *read);
CLI_SERVICE_API int32_t sqlochgfileptr(CLI_fileHandle handle, int64_t offset, int32_t origin,
                                       int32_t flags);
CLI_SERVICE_API int32_t sqloclose(CLI_fileHandle handle);

/* Memory blocks; 0 on success. */
CLI_SERVICE_API int32_t sqlogmblkEx(void *pool, uint64_t size, int32_t flags, void **block,
                                    const char *module, int32_t line, int32_t options);
CLI_SERVICE_API int32_t sqlofmblkEx(const char *module, int32_t line, void *block);

/* A line in the diagnostic log, with `dataSize` bytes of data. */
CLI_SERVICE_API void sqlt_logerr_data(const char *message, const void *data, int32_t dataSize,
                                      int32_t level);

/* ---- ORVAPP64 --------------------------------------------------------- */

/* Cleans a composed file path in place. */
CLI_SERVICE_API void sqlm_filter_file_name(char *path);
/* The header of the child element `element` among the inner elements of
 * the element whose header is given, or null. */
CLI_SERVICE_API const sqlm_header_info *sqlm_find_element(uint32_t element,
                                                          const sqlm_header_info *parent);

/* ---- ORVG11N64 -------------------------------------------------------- */

/* The encoding class of a code page (see standin/README.md). */
CLI_SERVICE_API int32_t sqlnls_Encoding2(uint32_t codePage, int32_t flags);

#ifdef __cplusplus
}
#endif

/* NOLINTEND(modernize-deprecated-headers, modernize-use-using) */
#endif
