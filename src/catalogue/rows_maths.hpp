// The catalogue's rows of the elementary functions, RAND and the number text
// conversions.
// catalogue.hpp joins the row files into the one table, in their order.
#pragma once

#include "catalogue/routine.hpp"

namespace cli::catalogue {

inline constexpr Routine kMathsRows[] = {
    // Elementary
    {
        .symbol = "CLI_udfSIN",
        .sqlName = "SIN",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .summary = "Sine of x radians.",
    },
    {
        .symbol = "CLI_udfCOS",
        .sqlName = "COS",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .summary = "Cosine of x radians.",
    },
    {
        .symbol = "CLI_udfTAN",
        .sqlName = "TAN",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::outOfRange},
        .summary = "Tangent of x radians.",
    },
    {
        .symbol = "CLI_udfCOT",
        .sqlName = "COT",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::divisionByZero},
        .summary = "Cotangent of x radians.",
    },
    {
        .symbol = "CLI_udfASIN",
        .sqlName = "ASIN",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::outOfRange},
        .summary = "Arc sine in radians.",
    },
    {
        .symbol = "CLI_udfACOS",
        .sqlName = "ACOS",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::outOfRange},
        .summary = "Arc cosine in radians.",
    },
    {
        .symbol = "CLI_udfATAN",
        .sqlName = "ATAN",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .summary = "Arc tangent in radians.",
    },
    {
        .symbol = "CLI_udfATAN2",
        .sqlName = "ATAN2",
        .inputs = {real("a"), real("b")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::divisionByZero},
        .summary = "Arc tangent of a / b in radians, by quadrant.",
    },
    {
        .symbol = "CLI_udfLOG",
        .sqlName = "LOG",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::outOfRange},
        .summary = "Natural logarithm.",
    },
    {
        .symbol = "CLI_udfLOG10",
        .sqlName = "LOG10",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::outOfRange},
        .summary = "Logarithm to base 10.",
    },
    {
        .symbol = "CLI_udfEXP",
        .sqlName = "EXP",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::overflow},
        .summary = "e to the power x.",
    },
    {
        .symbol = "CLI_udfSQRT",
        .sqlName = "SQRT",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .raises = {Sysfun::outOfRange},
        .summary = "Square root.",
    },
    {
        .symbol = "CLI_udfDEGREES1",
        .sqlName = "DEGREES",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .summary = "Radians in degrees.",
    },
    {
        .symbol = "CLI_udfRADIANS1",
        .sqlName = "RADIANS",
        .inputs = {real("x")},
        .results = {real()},
        .properties = kPure,
        .summary = "Degrees in radians.",
    },
    // Random
    {
        .symbol = "CLI_udfRAND1",
        .sqlName = "RAND",
        .results = {real()},
        .properties = kInnocuous | kSharedState,
        .summary = "A pseudo-random double from 0.0 to 1.0.",
    },
    {
        .symbol = "CLI_udfRAND2",
        .sqlName = "RAND",
        .frame = Frame::scratchpad,
        .inputs = {int32("seed")},
        .results = {real()},
        .properties = kInnocuous | kSharedState,
        .summary = "A pseudo-random double from 0.0 to 1.0; the first call of a statement seeds "
                   "the generator.",
    },
    // Number text
    {
        .symbol = "CLI_udfCHARTODOUBLE",
        .sqlName = "CHARTODOUBLE",
        .inputs = {text("text")},
        .results = {real()},
        .properties = kPure | kResultByAddress | kWritesInputs,
        .raises = {Sysfun::notANumber},
        .summary = "The number that a text spells, as a double.",
    },
    {
        .symbol = "CLI_udfDOUBLETOCHAR",
        .sqlName = "DOUBLETOCHAR",
        .inputs = {real("x")},
        .results = {fixedText(24)},
        .properties = kPure,
        .summary = "A double in short scientific notation, 24 bytes filled up with blanks.",
    },
};

}  // namespace cli::catalogue
