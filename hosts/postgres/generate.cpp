// orv_pg_generate: writes the PostgreSQL extension from the catalogue.
//
//   orv_pg_generate VERSION OUTPUT-FOLDER [EARLIER-VERSION...]
//
// writes, in OUTPUT-FOLDER:
//   orvclifn.control         the control file
//   orvclifn--VERSION.sql    the install script: the schema's functions
//   orvclifn--E--VERSION.sql an update script from each earlier version E
//   entries.cpp              the module's C entry point of each function
//
// Nothing here names a routine: every function comes from a catalogue row
// through the rules of signatures.hpp.
#include <algorithm>
#include <cstdio>
#include <fstream>
#include <iostream>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "signatures.hpp"

namespace {

using orv::pg::Signature;
using orv::pg::Type;
namespace cat = cli::catalogue;

// Column names of the table functions, by what the host's rows hold (see
// tables.cpp) and by the snapshot's element identifiers.
struct Columns {
  const char *symbol;
  std::vector<const char *> names;
};
const Columns kColumns[] = {
    {"CLI_udfFmpThreads", {"pid", "database_oid", "role_oid", "process_type", "state", "started"}},
    {"CLI_udfFmpRows", {"table_oid", "pages", "columns", "kind", "persistence", "has_index"}},
    {"SQLCACHE_SNAPSHOT",
     {"element_554", "element_540", "element_521", "element_539", "element_446", "element_487",
      "element_522", "element_447", "element_523", "element_532", "element_229_300",
      "element_229_301", "element_586_300", "element_586_301", "element_585_300", "element_585_301",
      "section", "statement"}},
};

std::string columnName(const cat::Routine &r, std::size_t i) {
  for (const Columns &c : kColumns) {
    if (std::string_view(c.symbol) == r.symbol && i < c.names.size()) return c.names[i];
  }
  return "column" + std::to_string(i + 1);
}

std::string quoted(const std::string &identifier) { return '"' + identifier + '"'; }

std::string literal(std::string_view text) {
  std::string out = "'";
  for (char c : text) {
    if (c == '\'') out += '\'';
    out += c;
  }
  return out + "'";
}

std::string argumentName(const char *name) {
  std::string out = name != nullptr && name[0] != '\0' ? name : "value";
  for (char &c : out) {
    if (c == ' ') c = '_';
  }
  return out;
}

const char *layoutType(cat::Layout l) {
  switch (l) {
    case cat::Layout::int16:
      return "int2";
    case cat::Layout::int32:
      return "int4";
    case cat::Layout::int64:
      return "int8";
    case cat::Layout::real:
      return "float8";
    default:
      return "text";
  }
}

// The argument list of a function, with names (for CREATE) or without.
std::string argumentList(const Signature &s, bool named) {
  const cat::Routine &r = cat::kRoutines[s.row()];
  std::string out;
  for (std::size_t i = 0; i < s.arguments.size(); ++i) {
    if (i != 0) out += ", ";
    if (named) out += quoted(argumentName(r.inputs[i].name)) + " ";
    out += orv::pg::sqlType(s.arguments[i]);
  }
  return out;
}

std::string summary(const Signature &s) {
  std::string text = cat::kRoutines[s.row()].summary;
  if (s.textRow != orv::pg::kNoRow && s.lobRow != orv::pg::kNoRow) {
    text += " (" + std::string(cat::kRoutines[s.textRow].symbol) +
            " for text of up to 4000 bytes, " + cat::kRoutines[s.lobRow].symbol + " beyond.)";
  } else {
    text += " (" + std::string(cat::kRoutines[s.row()].symbol) + ".)";
  }
  return text;
}

std::string createFunction(const Signature &s) {
  const cat::Routine &r = cat::kRoutines[s.row()];
  std::ostringstream out;
  out << "CREATE OR REPLACE FUNCTION @extschema@." << quoted(s.name) << "(" << argumentList(s, true)
      << ")\n  RETURNS ";
  if (s.table()) {
    out << "TABLE(";
    for (std::size_t i = 0; i < cat::resultCount(r); ++i) {
      out << (i != 0 ? ", " : "") << quoted(columnName(r, i)) << " "
          << layoutType(r.results[i].layout);
    }
    out << ")";
  } else {
    out << orv::pg::sqlType(s.result);
  }
  out << "\n  AS 'MODULE_PATHNAME', '" << s.symbol << "'\n  LANGUAGE C ";
  if (s.table()) {
    // The rows come from the server's state and from files: they change.
    out << "VOLATILE STRICT PARALLEL RESTRICTED";
  } else {
    // A timestamp with time zone is read in the session's time zone.
    const bool zoned =
        std::find(s.arguments.begin(), s.arguments.end(), Type::timestamptz) != s.arguments.end();
    const bool deterministic = (r.properties & cat::kDeterministic) != 0;
    out << (deterministic && !zoned                          ? "IMMUTABLE"
            : deterministic || r.frame == cat::Frame::dbinfo ? "STABLE"
                                                             : "VOLATILE");
    out << ((r.properties & cat::kHandlesNull) != 0 ? " CALLED ON NULL INPUT" : " STRICT");
    out << ((r.properties & cat::kSharedState) != 0 ? " PARALLEL RESTRICTED" : " PARALLEL SAFE");
  }
  out << ";\nCOMMENT ON FUNCTION @extschema@." << quoted(s.name) << "(" << argumentList(s, false)
      << ") IS " << literal(summary(s)) << ";\n";
  return out.str();
}

std::string entryPoint(const Signature &s) {
  std::ostringstream out;
  out << "PG_FUNCTION_INFO_V1(" << s.symbol << ");\nPGDLLEXPORT Datum " << s.symbol
      << "(PG_FUNCTION_ARGS);\n}\nDatum " << s.symbol << "(PG_FUNCTION_ARGS) {\n  return ";
  if (s.table()) {
    out << "orv::pg::table<" << s.row() << ">(fcinfo);\n}\n";
  } else {
    const auto row = [](std::size_t r) {
      return r == orv::pg::kNoRow ? std::string("kNoRow") : std::to_string(r);
    };
    out << "scalar<" << row(s.textRow) << ", " << row(s.lobRow) << ", "
        << orv::pg::cppType(s.result);
    for (Type t : s.arguments) out << ", " << orv::pg::cppType(t);
    out << ">(fcinfo);\n}\n";
  }
  out << "extern \"C\" {\n";
  return out.str();
}

bool write(const std::string &path, const std::string &text) {
  std::ofstream out(path, std::ios::binary);
  out << text;
  if (!out) std::cerr << "orv_pg_generate: cannot write " << path << "\n";
  return static_cast<bool>(out);
}

}  // namespace

int main(int argc, char **argv) {
  if (argc < 3) {
    std::cerr << "usage: orv_pg_generate VERSION OUTPUT-FOLDER [EARLIER-VERSION...]\n";
    return 2;
  }
  const std::string version = argv[1], folder = argv[2];
  const std::vector<Signature> signatures = orv::pg::signatures();

  std::set<std::string> seen;
  std::string functions;
  std::string entries =
      "// Written by orv_pg_generate from the catalogue; do not edit.\n"
      "#include \"server.hpp\"\n// server.hpp first.\n#include \"scalar.hpp\"\n"
      "#include \"tables.hpp\"\n\nusing orv::pg::kNoRow;\nusing orv::pg::scalar;\n"
      "using orv::pg::Type;\n\n// NOLINTBEGIN\nextern \"C\" {\n";
  for (const Signature &s : signatures) {
    const std::string key = s.name + "(" + argumentList(s, false) + ")";
    if (!seen.insert(key).second) {
      std::cerr << "orv_pg_generate: two functions " << key << "\n";
      return 1;
    }
    functions += createFunction(s) + "\n";
    entries += entryPoint(s);
  }
  entries += "}\n// NOLINTEND\n";

  const std::string header =
      "-- Written by orv_pg_generate from the catalogue of orvclifn " + version + ".\n";
  const std::string install =
      header + "\\echo Use \"CREATE EXTENSION orvclifn\" to load this file. \\quit\n\n" + functions;
  const std::string control =
      "# orvclifn: SQL routines under the tag SYSFUN, in the schema sysfun\n"
      "comment = 'Date and time, numeric, string and phonetic functions that report errors "
      "under the tag SYSFUN'\n"
      "default_version = '" +
      version +
      "'\n"
      "module_pathname = '$libdir/orvclifn'\n"
      "relocatable = false\n"
      "schema = sysfun\n"
      "superuser = true\n";
  bool ok = write(folder + "/orvclifn.control", control) &&
            write(folder + "/orvclifn--" + version + ".sql", install) &&
            write(folder + "/entries.cpp", entries);
  // Every function is created with CREATE OR REPLACE, so the install
  // script also brings any earlier version up to this one, as long as no
  // function has gone; one that has is dropped by hand in its script.
  for (int i = 3; ok && i < argc; ++i) {
    const std::string earlier = argv[i];
    std::string update = "-- Written by orv_pg_generate: orvclifn ";
    update += earlier;
    update += " to ";
    update += version;
    update += ".\n\\echo Use \"ALTER EXTENSION orvclifn UPDATE\" to load this file. \\quit\n\n";
    update += functions;
    std::string path = folder;
    path += "/orvclifn--";
    path += earlier;
    path += "--";
    path += version;
    path += ".sql";
    ok = write(path, update);
  }
  return ok ? 0 : 1;
}
