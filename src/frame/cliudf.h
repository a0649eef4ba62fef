/*
 * cliudf.h - the routine frame shared by every export of orvclifn.
 *
 * Plain C, so that an engine or a host written in C can include it.  An
 * export takes only pointers and returns nothing.  For a routine with N
 * inputs and M results the arguments are, in this order:
 *
 *   N input value pointers, M result pointers,
 *   N input null indicators, M result null indicators  (each int16_t *),
 *   SQLSTATE buffer, function name, specific name, diagnostic message,
 *   then the extras of the routine's frame variant, if any:
 *     database information block                 (DAYNAME, MONTHNAME)
 *     scratchpad                                 (RAND2)
 *     scratchpad, call type                      (SQLCACHE_SNAPSHOT)
 *     scratchpad, call type, table callback      (FmpThreads, FmpRows)
 *
 * Success writes the result and leaves the status buffers alone; failure
 * writes a status into them and leaves the result indicator alone.
 */
#ifndef ORVCLIFN_CLIUDF_H
#define ORVCLIFN_CLIUDF_H

/* NOLINTBEGIN(modernize-deprecated-headers, modernize-use-using): plain C */
#include <stdint.h>
#include <string.h>

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Value layouts -------------------------------------------------- */

/* A null indicator: negative means NULL, zero or positive means a value. */
typedef int16_t CLI_nullIndicator;

/*
 * A large string or object: a 32-bit unsigned length, then at once that many
 * data bytes, with no terminator.  The data starts CLI_LOB_DATA_OFFSET bytes
 * after the start of the value; sizeof(CLI_udfLob) is not the size of a value.
 * On entry the length word of a result holds the capacity of its area.
 */
typedef struct CLI_udfLob {
  uint32_t length;
  char data[1];
} CLI_udfLob;

#define CLI_LOB_DATA_OFFSET 4u
/* Bytes an area needs to hold a CLI_udfLob of n data bytes. */
#define CLI_LOB_AREA_SIZE(n) (CLI_LOB_DATA_OFFSET + (n))

/* Longest terminated text that a routine builds (the area holds one more). */
#define CLI_TEXT_LIMIT 4000
/* Longest CLI_udfLob string, where a routine enforces a limit. */
#define CLI_LOB_LIMIT 1048576

/* Five characters and a terminator. */
#define CLI_SQLSTATE_SIZE 6
/* The longest message is "API call failed -2147483648" with its terminator. */
#define CLI_MESSAGE_SIZE 28

/* The scratchpad's first word belongs to the engine; routine data follows. */
#define CLI_SCRATCHPAD_DATA_OFFSET 4
/* Bytes of a scalar routine's scratchpad: the engine's word and 100 bytes of data. */
#define CLI_SCRATCHPAD_SIZE (CLI_SCRATCHPAD_DATA_OFFSET + 100)
/* Byte offset of the database code page in the database information block. */
#define CLI_DBINFO_CODEPAGE_OFFSET 268

/* ---- Call types of a table function --------------------------------- */

#define CLI_CALL_OPEN (-1)
#define CLI_CALL_FETCH 0
#define CLI_CALL_CLOSE 1

/* The engine's entry handed to a table function: slot count, request record. */
typedef int32_t (*CLI_tableCallback)(int32_t slotCount, void *request);

/* ---- Status codes --------------------------------------------------- */

#define CLI_SQLSTATE_SYSFUN "38552"
#define CLI_SQLSTATE_NO_MORE_ROWS "02000"
#define CLI_SQLSTATE_OPEN_CALLBACK_FAILED "38620"
#define CLI_SQLSTATE_CLOSE_CALLBACK_FAILED "38660"
#define CLI_SQLSTATE_RESULT_TOO_SMALL "38601"
#define CLI_SQLSTATE_CONVERSION_FAILED "38602"
#define CLI_SQLSTATE_UNKNOWN_LENGTH_FORM "38603"

#define CLI_MESSAGE_SYSFUN "SYSFUN:"
#define CLI_MESSAGE_API_CALL_FAILED "API call failed %d"
#define CLI_MESSAGE_SQLOCPCV "sqlocpcv"

/*
 * The SYSFUN codes that follow "SYSFUN:", one entry each: the number, a
 * name, the two characters and the condition in words.  The library, the
 * hosts' messages and the function reference are all made from this one
 * table.  There is no 09, and nothing stands above 11.
 */
#define CLI_SYSFUN_CODES(X)                                                          \
  X(1, outOfRange, "01", "an argument lies outside what the function accepts")       \
  X(2, divisionByZero, "02", "division by zero")                                     \
  X(3, overflow, "03", "the result cannot be represented")                           \
  X(4, badDate, "04", "the date is not valid")                                       \
  X(5, badTime, "05", "the time is not valid")                                       \
  X(6, badTimestamp, "06",                                                           \
    "the time of the timestamp is not valid, or the text has no form that is taken") \
  X(7, badDuration, "07", "the duration holds a character that is not allowed")      \
  X(8, badInterval, "08", "the interval code is not a known one")                    \
  X(10, tooLong, "10", "a string would be longer than the function allows")          \
  X(11, notANumber, "11", "the text is not a number")

/*
 * Reports SYSFUN error `code` (two characters): "38552" with its terminator
 * goes into the SQLSTATE buffer, "SYSFUN:" and the code with a terminator
 * into the message buffer.  Nothing else is touched; the caller returns.
 */
static inline void CLI_raiseSysfun(char *sqlstate, char *message, const char *code) {
  memcpy(sqlstate, CLI_SQLSTATE_SYSFUN, sizeof CLI_SQLSTATE_SYSFUN);
  memcpy(message, CLI_MESSAGE_SYSFUN, sizeof CLI_MESSAGE_SYSFUN - 1);
  message[7] = code[0];
  message[8] = code[1];
  message[9] = '\0';
}

/* Marks the file as a library of the engine: a 32-bit word holding 0. */
extern const int32_t sqlzThisIsAORVLibrary;

#ifdef __cplusplus
}
#endif

/* NOLINTEND(modernize-deprecated-headers, modernize-use-using) */
#endif /* ORVCLIFN_CLIUDF_H */
