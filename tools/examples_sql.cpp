// Writes the scripts that hold every row's example (Example, in
// src/catalogue/routine.hpp) against both hosts, each example called by
// its export's own name, so that it reaches that export and no other:
//
//   examples_sql SQLITE-SCRIPT POSTGRES-SCRIPT
//
// SQLITE-SCRIPT has one statement a line, giving 'ok' or the result that
// disagrees, for tests/test_sqlite_host.cpp.  POSTGRES-SCRIPT gives a row
// only for a result that disagrees; hosts/postgres/test/run hands it to
// pg_regress as the test `examples`.  Integers compare as numbers, doubles
// within 1e-12 of the expected value (relative beyond 1), text and bytes
// exactly.  The PostgreSQL calls cast each argument to the type of the
// row's layout there, so that the extension's own type resolution picks
// the export's function.
//
// Rows without an example are table functions: neither host calls them as
// scalar functions, and their rows are the engine's data.  An example whose
// arguments don't fit the row's layouts, or that the hosts' naming rules
// would take to another export, stops the build.
#include <cstddef>
#include <fstream>
#include <iostream>
#include <string>
#include <string_view>
#include <vector>

#include "postgres/signatures.hpp"
#include "registry.hpp"

namespace {

namespace cat = cli::catalogue;
using cat::kRoutines;
using cat::Layout;
using cat::Routine;

enum class Kind : unsigned char { number, string, bytes };

struct Literal {
  std::string text;
  Kind kind = Kind::number;
};

Kind kindOf(std::string_view literal) {
  if (literal.starts_with('\'')) return Kind::string;
  if (literal.starts_with("x'") || literal.starts_with("X'")) return Kind::bytes;
  return Kind::number;
}

// The arguments of a call NAME(a, b, ...), split at the commas that stand
// outside quotes.
std::vector<Literal> argumentsOf(std::string_view call) {
  std::vector<Literal> out;
  const std::size_t open = call.find('('), close = call.rfind(')');
  std::string current;
  bool quoted = false;
  for (const char c : call.substr(open + 1, close - open - 1)) {
    if (c == '\'') quoted = !quoted;  // '' inside a string toggles twice
    if (c == ',' && !quoted) {
      out.push_back({current, kindOf(current)});
      current.clear();
    } else if (!current.empty() || c != ' ') {
      current += c;
    }
  }
  if (!current.empty()) out.push_back({current, kindOf(current)});
  return out;
}

bool fits(Layout layout, Kind kind) {
  switch (layout) {
    case Layout::text:
      return kind == Kind::string;
    case Layout::lob:
      return kind != Kind::number;
    case Layout::fixedBytes:
      return kind == Kind::bytes;
    default:
      return kind == Kind::number;
  }
}

// A condition on the result (LIKE, BETWEEN), or empty for a literal.
bool isCondition(std::string_view result) {
  return result.starts_with("LIKE ") || result.starts_with("BETWEEN ");
}

// PostgreSQL spells bytes as '\x0A1B'::bytea.
std::string postgresLiteral(const Literal &l) {
  return l.kind == Kind::bytes ? "'\\x" + l.text.substr(2) + "::bytea" : l.text;
}

// The condition that the result `v` meets when the example holds.
std::string check(const Routine &r, const std::string &result, const char *greatest) {
  if (isCondition(result)) return "v " + result;
  if (r.results[0].layout == Layout::real) {
    return "abs(v - " + result + ") <= 1e-12 * " + greatest + "(1, abs(" + result + "))";
  }
  return "v = " + result;
}

std::string sqliteStatement(std::size_t row, const std::vector<Literal> &arguments) {
  const Routine &r = kRoutines[row];
  std::string call = orv::sqlite::ownName(r) + "(";
  orv::sqlite::KindMask mask = 0;
  for (std::size_t i = 0; i < arguments.size(); ++i) {
    const Literal &a = arguments[i];
    call += (i == 0 ? "" : ", ") + a.text;
    // What the host's choice of form looks at: a REAL, or a BLOB.
    const bool real = a.kind == Kind::number && a.text.find_first_of(".eE") != std::string::npos;
    if (real || a.kind == Kind::bytes) mask |= 1u << i;
  }
  call += ")";
  // The export's own name reaches the row, by the host's own rules.
  bool reached = false;
  for (const orv::sqlite::Group &g : orv::sqlite::groups()) {
    reached = reached || (g.sysfunName == orv::sqlite::ownName(r) &&
                          g.argumentCount == static_cast<int>(arguments.size()) &&
                          orv::sqlite::chooseForm(g, mask) == static_cast<int>(row));
  }
  if (!reached) return "";
  return "SELECT CASE WHEN " + check(r, r.example.result, "max") +
         " THEN 'ok' ELSE quote(v) END FROM (SELECT " + call + " AS v);";
}

std::string postgresStatement(std::size_t row, const std::vector<Literal> &arguments) {
  const Routine &r = kRoutines[row];
  const std::string name = orv::pg::exportName(r);
  std::vector<orv::pg::Type> types;
  std::string call = "sysfun.\"" + name + "\"(";
  for (std::size_t i = 0; i < arguments.size(); ++i) {
    const Literal &a = arguments[i];
    types.push_back(orv::pg::argumentType(
        r.inputs[i].layout, a.kind == Kind::bytes ? orv::pg::Type::bytea : orv::pg::Type::text));
    call += std::string(i == 0 ? "" : ", ") + "CAST(" + postgresLiteral(a) + " AS " +
            orv::pg::sqlType(types.back()) + ")";
  }
  call += ")";
  // The function of that name and these types serves the row.
  bool reached = false;
  for (const orv::pg::Signature &s : orv::pg::signatures()) {
    reached = reached || (s.name == name && s.arguments == types && s.row() == row);
  }
  if (!reached) return "";
  const std::string result = r.example.result;
  const std::string expected = isCondition(result) || r.results[0].layout != Layout::real
                                   ? postgresLiteral({result, kindOf(result)})
                                   : "CAST(" + result + " AS float8)";
  return "SELECT '" + std::string(r.symbol) + " gave ' || coalesce(v::text, 'NULL') FROM (SELECT " +
         call + " AS v) AS example WHERE (" + check(r, expected, "greatest") + ") IS NOT TRUE;";
}

bool write(const char *path, const std::string &text) {
  std::ofstream out(path, std::ios::binary);
  out << text;
  if (!out) std::cerr << "examples_sql: cannot write " << path << "\n";
  return static_cast<bool>(out);
}

}  // namespace

int main(int argc, char **argv) {
  if (argc != 3) {
    std::cerr << "usage: examples_sql SQLITE-SCRIPT POSTGRES-SCRIPT\n";
    return 2;
  }
  std::string sqlite;
  std::string postgres =
      "-- Each example of the catalogue by its export's own name; a row of\n"
      "-- output is an example whose result disagrees (tools/examples_sql.cpp).\n"
      "\\set ECHO none\n\\pset format unaligned\n\\pset tuples_only on\n";
  for (std::size_t row = 0; row < kRoutines.size(); ++row) {
    const Routine &r = kRoutines[row];
    if (r.example.call == nullptr) continue;
    const std::string_view call = r.example.call;
    const std::vector<Literal> arguments = argumentsOf(call);
    bool ok = call.substr(0, call.find('(')) == r.sqlName && arguments.size() == cat::inputCount(r);
    for (std::size_t i = 0; ok && i < arguments.size(); ++i) {
      ok = fits(r.inputs[i].layout, arguments[i].kind);
    }
    const std::string lite = ok ? sqliteStatement(row, arguments) : "";
    const std::string pg = ok ? postgresStatement(row, arguments) : "";
    if (lite.empty() || pg.empty()) {
      std::cerr << "examples_sql: the example of " << r.symbol << ", " << r.example.call
                << ", does not reach it by its own name\n";
      return 1;
    }
    sqlite += lite + "\n";
    postgres += pg + "\n";
  }
  return write(argv[1], sqlite) && write(argv[2], postgres) ? 0 : 1;
}
