// PostgreSQL's server headers, for C++.  Included first by every file of
// the module.
//
// PostgreSQL reports an ERROR by a long jump out of the function that
// raises it.  A jump over a C++ frame skips its destructors, so no function
// of the module that can reach an ERROR holds an object with a destructor:
// what they hold is plain data, and memory comes from PostgreSQL's memory
// contexts, which it frees itself.
#pragma once

// The module's entry points are the only symbols it shows.
#define PGDLLEXPORT __attribute__((visibility("default")))

extern "C" {
#include "postgres.h"
// The order of these matters to PostgreSQL's headers.
#include "fmgr.h"
#include "funcapi.h"
#include "mb/pg_wchar.h"
#include "miscadmin.h"
#include "utils/builtins.h"
#include "utils/date.h"
#include "utils/fmgrprotos.h"
#include "utils/lsyscache.h"
#include "utils/timestamp.h"
}
