// The catalogue's rows of the routines bound to the engine's data and
// services.
// catalogue.hpp joins the row files into the one table, in their order.
#pragma once

#include "catalogue/routine.hpp"

namespace cli::catalogue {

inline constexpr Routine kEngineRows[] = {
    // Table functions.  Their rows are the engine's data, so they have no
    // example with a result that a test could hold them to.
    {
        .symbol = "CLI_udfFmpThreads",
        .sqlName = "FmpThreads",
        .frame = Frame::tableCallback,
        .inputs = {int32("selector")},
        .results = {int32(), int32(), int32(), int32(), int32(), int32()},
        .summary = "The engine's table of Fmp threads.",
    },
    {
        .symbol = "CLI_udfFmpRows",
        .sqlName = "FmpRows",
        .frame = Frame::tableCallback,
        .results = {int32(), int32(), int16(), int16(), int16(), int16()},
        .summary = "The engine's table of Fmp rows.",
    },
    // Cache snapshot
    {
        .symbol = "SQLCACHE_SNAPSHOT",
        .sqlName = "SQLCACHE_SNAPSHOT",
        .frame = Frame::table,
        .results = {int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(), int32(),
                    int32(), int32(), int32(), int32(), int32(), int32(), int32(), textOf(8),
                    lobOf(kLob)},
        .summary = "One row per statement of the SQL statement cache snapshot.",
    },
    // Object copy
    {
        .symbol = "CLI_udfVEBLOB_CP_LARGE",
        .sqlName = "VEBLOB_CP_LARGE",
        .inputs = {lob("object"), int32("source code page"), int32("target code page"),
                   int32("byte order")},
        .results = {lobOf(1000000)},
        .properties = kPure | kHandlesNull,
        .summary = "A record-chain object copied into another code page, up to 1000000 bytes.",
        .example = {"VEBLOB_CP_LARGE(x'000000000000000000000000000000000000000000004B02C3A9', "
                    "1208, 819, 0)",
                    "x'000000000000000000000000000000000000000000004B01E9'"},
    },
    {
        .symbol = "CLI_udfVEBLOB_CP_SMALL",
        .sqlName = "VEBLOB_CP_SMALL",
        .inputs = {lob("object"), int32("source code page"), int32("target code page"),
                   int32("byte order")},
        .results = {lobOf(500000)},
        .properties = kPure | kHandlesNull,
        .summary = "A record-chain object copied into another code page, up to 500000 bytes.",
        .example = {"VEBLOB_CP_SMALL(x'000000000000000000000000000000000000000000008B00024142', "
                    "1208, 819, -1)",
                    "x'000000000000000000000000000000000000000000008B00024142'"},
    },
    // Collation
    {
        .symbol = "CLI_udfCOLLATIONNAME",
        .sqlName = "COLLATIONNAME",
        .inputs = {bytes(8, "collation id")},
        .results = {textOf(128)},
        .properties = kPure | kHandlesNull,
        .summary = "Name of a collation identifier; INVALID for NULL or an unknown one.",
        .example = {"COLLATIONNAME(x'0000000000000000')", "'IDENTITY'"},
    },
};

}  // namespace cli::catalogue
