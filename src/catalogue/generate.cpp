// Writes, from the catalogue's rows, everything that names the exports:
//
//   exports.cpp    the extern "C" exports, each handing its arguments to
//                  shim::run with its routine's logic
//   routines.hpp   the declaration of each routine's logic, with the typed
//                  views that its row implies (the logic's definition must
//                  match it, or it does not compile)
//   orvclifn.map   the linker's version script: the exports, nothing else
//   orvclifn.def   the same as a Windows module definition
//   orvclifn.h     the public C header: every export with its signature
//
// into the current folder, rewriting a file only when its text changes.
// Usage: orv_generate
#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "catalogue/catalogue.hpp"

namespace {

using cli::catalogue::Frame;
using cli::catalogue::kHandlesNull;
using cli::catalogue::kRoutines;
using cli::catalogue::Layout;
using cli::catalogue::Routine;
using cli::catalogue::Slot;
using cli::frame::Positions;

bool isNumber(Layout l) {
  return l == Layout::int16 || l == Layout::int32 || l == Layout::int64 || l == Layout::real;
}
bool isTable(const Routine &r) {
  return r.frame == Frame::table || r.frame == Frame::tableCallback;
}
bool handlesNull(const Routine &r) { return (r.properties & kHandlesNull) != 0; }
// A routine whose one result is a number gives it back in an Answer,
// unless a service writes it at its address.
bool answers(const Routine &r) {
  return !isTable(r) && isNumber(r.results[0].layout) &&
         (r.properties & cli::catalogue::kResultByAddress) == 0;
}

// The routine's name in the library: the export without CLI_udf.
std::string logicName(const Routine &r) {
  std::string_view s = r.symbol;
  if (s.starts_with("CLI_udf")) s.remove_prefix(7);
  return std::string(s);
}

// A slot's name as an identifier: "source code page" is source_code_page.
std::string identifier(const char *name, const std::string &fallback) {
  std::string out = name == nullptr ? "" : name;
  for (char &c : out) {
    if (c == ' ') c = '_';
  }
  return out.empty() ? fallback : out;
}
std::string inputName(const Routine &r, std::size_t i) {
  return identifier(r.inputs[i].name, "input" + std::to_string(i + 1));
}
std::string resultName(const Routine &r, std::size_t i) {
  return resultCount(r) == 1 ? "result" : "column" + std::to_string(i + 1);
}

const char *numberType(Layout l) {
  switch (l) {
    case Layout::int16:
      return "int16_t";
    case Layout::int32:
      return "int32_t";
    case Layout::int64:
      return "int64_t";
    default:
      return "double";
  }
}

// The C type of an input's or a result's pointer.
std::string inputPointer(const Slot &s) {
  switch (s.layout) {
    case Layout::text:
      return "char *";  // writable: a routine may cut blanks in place
    case Layout::lob:
      return "const CLI_udfLob *";
    case Layout::fixedBytes:
      return "const unsigned char *";
    default:
      return std::string("const ") + numberType(s.layout) + " *";
  }
}
std::string resultPointer(const Slot &s) {
  switch (s.layout) {
    case Layout::text:
    case Layout::fixedText:
      return "char *";
    case Layout::lob:
      return "CLI_udfLob *";
    default:
      return std::string(numberType(s.layout)) + " *";
  }
}

// The extras, in their frame order: where the export's parameter stands,
// the parameter, and the view that the routine's logic takes in its place.
struct Extra {
  std::size_t Positions::*at;
  const char *argument;
  const char *view;
};
constexpr Extra kExtras[] = {
    {&Positions::dbinfo, "const unsigned char *dbinfo", "DbInfo dbinfo"},
    {&Positions::scratchpad, "unsigned char *scratchpad", "Scratchpad scratchpad"},
    {&Positions::callType, "const int32_t *call_type", "CallType call_type"},
    {&Positions::callback, "CLI_tableCallback callback", "CLI_tableCallback callback"},
};

// The export's parameters, each at its position in the frame.
std::vector<std::string> parameters(const Routine &r) {
  const Positions at = positionsOf(r);
  std::vector<std::string> p(at.count);
  for (std::size_t i = 0; i < at.inputs; ++i) {
    p[at.input(i)] = inputPointer(r.inputs[i]) + inputName(r, i);
    p[at.inputIndicator(i)] = "const int16_t *" + inputName(r, i) + "_null";
  }
  for (std::size_t j = 0; j < at.results; ++j) {
    p[at.result(j)] = resultPointer(r.results[j]) + resultName(r, j);
    p[at.resultIndicator(j)] = "int16_t *" + resultName(r, j) + "_null";
  }
  p[at.sqlstate] = "char *sqlstate";
  p[at.functionName] = "const char *function_name";
  p[at.specificName] = "const char *specific_name";
  p[at.message] = "char *message";
  for (const Extra &e : kExtras) {
    if (cli::frame::present(at.*e.at)) p[at.*e.at] = e.argument;
  }
  return p;
}

std::string joined(const std::vector<std::string> &parts, const std::string &between) {
  std::string out;
  for (std::size_t i = 0; i < parts.size(); ++i) out += (i == 0 ? "" : between) + parts[i];
  return out;
}

// The name a parameter declares: what follows its last blank or star.
std::string declared(const std::string &parameter) {
  return parameter.substr(parameter.find_last_of(" *") + 1);
}

// The declaration of a routine's logic, with the views its row implies.
std::string logicDeclaration(const Routine &r) {
  std::vector<std::string> p;
  for (std::size_t i = 0; i < inputCount(r); ++i) {
    const Slot &s = r.inputs[i];
    const bool writable = (r.properties & cli::catalogue::kWritesInputs) != 0;
    std::string type = s.layout == Layout::text  ? (writable ? "WritableTextIn" : "TextIn")
                       : s.layout == Layout::lob ? "LobIn"
                       : s.layout == Layout::fixedBytes
                           ? "BytesIn"
                           : std::string("std::") + numberType(s.layout);
    if (type == "std::double") type = "double";
    if (handlesNull(r)) {
      type.insert(0, "Nullable<");
      type += '>';
    }
    type += " ";
    type += inputName(r, i);
    p.push_back(type);
  }
  std::string returned = "Report";
  if (isTable(r)) {
    p.emplace_back("Row row");
  } else if (answers(r)) {
    const Layout l = r.results[0].layout;
    returned = std::string("Answer<") + (l == Layout::real ? "" : "std::") + numberType(l) + ">";
  } else if (isNumber(r.results[0].layout)) {
    p.push_back(std::string(r.results[0].layout == Layout::real ? "" : "std::") +
                numberType(r.results[0].layout) + " *result");
  } else {
    const Layout l = r.results[0].layout;
    p.emplace_back(std::string(l == Layout::text  ? "TextOut"
                               : l == Layout::lob ? "LobOut"
                                                  : "FixedTextOut") +
                   " result");
    if (handlesNull(r)) p.emplace_back("ResultIndicator result_null");
  }
  for (const Extra &e : kExtras) {
    if (cli::frame::present(positionsOf(r).*e.at)) p.emplace_back(e.view);
  }
  return "// " + std::string(r.summary) + "\n" + returned + " " + logicName(r) + "(" +
         joined(p, ", ") + ") noexcept;\n";
}

std::string exportsSource() {
  std::string out =
      "// Written by orv_generate from the catalogue; do not edit.\n"
      "#include \"frame/shim.hpp\"\n"
      "#include \"routines.hpp\"\n";
  std::size_t row = 0;
  for (const Routine &r : kRoutines) {
    const std::vector<std::string> p = parameters(r);
    std::vector<std::string> names;
    names.reserve(p.size());
    for (const std::string &s : p) names.push_back(declared(s));
    out += "\nCLI_EXPORT void " + std::string(r.symbol) + "(" + joined(p, ", ") + ") noexcept {\n" +
           "  cli::shim::run<" + std::to_string(row) + ", cli::routine::" + logicName(r) + ">(" +
           joined(names, ", ") + ");\n}\n";
    ++row;
  }
  return out;
}

std::string routinesHeader() {
  std::string out =
      "// Written by orv_generate from the catalogue; do not edit.\n"
      "// The logic of every routine, as its row declares it.\n"
      "#pragma once\n\n"
      "#include <cstdint>\n\n"
      "#include \"frame/frame.hpp\"\n\n"
      "namespace cli::routine {\n";
  for (const Routine &r : kRoutines) {
    out += '\n';
    out += logicDeclaration(r);
  }
  out += "\n}  // namespace cli::routine\n";
  return out;
}

std::string versionScript() {
  std::string out = "{\n  global:\n    " + std::string(cli::catalogue::kDataExport) + ";\n";
  for (const Routine &r : kRoutines) out += "    " + std::string(r.symbol) + ";\n";
  return out + "  local:\n    *;\n};\n";
}

// No LIBRARY line: the linker takes the name of the file it writes.  The
// data export is marked DATA, so that it stays a data symbol.
std::string moduleDefinition() {
  std::string out = "EXPORTS\n    " + std::string(cli::catalogue::kDataExport) + " DATA\n";
  for (const Routine &r : kRoutines) out += "    " + std::string(r.symbol) + "\n";
  return out;
}

std::string publicHeader() {
  std::string out =
      "/*\n * orvclifn.h - every export of orvclifn with its frame.\n"
      " * Written by orv_generate from the catalogue.\n */\n"
      "#ifndef ORVCLIFN_H\n#define ORVCLIFN_H\n\n#include \"cliudf.h\"\n\n"
      "#ifdef __cplusplus\nextern \"C\" {\n#endif\n";
  for (const Routine &r : kRoutines) {
    // A caller that passes a buffer it must keep as it is needs to know.
    const char *writes = (r.properties & cli::catalogue::kWritesInputs) != 0
                             ? " Cuts trailing blanks off its text input in place."
                             : "";
    out += "\n/* " + std::string(r.sqlName) + ": " + r.summary + writes + " */\nvoid " + r.symbol +
           "(" + joined(parameters(r), ", ") + ");\n";
  }
  return out + "\n#ifdef __cplusplus\n}\n#endif\n\n#endif /* ORVCLIFN_H */\n";
}

// Writes `text` to `path` unless the file holds it already, so that an
// unchanged catalogue rebuilds nothing.
bool writeIfChanged(const char *path, const std::string &text) {
  std::string old;
  if (std::FILE *f = std::fopen(path, "rb")) {
    char buffer[4096];
    for (std::size_t n; (n = std::fread(buffer, 1, sizeof buffer, f)) > 0;) old.append(buffer, n);
    static_cast<void>(std::fclose(f));
    if (old == text) return true;
  }
  std::FILE *f = std::fopen(path, "wb");
  if (f == nullptr) return false;
  const bool written = std::fwrite(text.data(), 1, text.size(), f) == text.size();
  return std::fclose(f) == 0 && written;
}

}  // namespace

int main() {
  const bool ok = writeIfChanged("exports.cpp", exportsSource()) &&
                  writeIfChanged("routines.hpp", routinesHeader()) &&
                  writeIfChanged("orvclifn.map", versionScript()) &&
                  writeIfChanged("orvclifn.def", moduleDefinition()) &&
                  writeIfChanged("orvclifn.h", publicHeader());
  if (!ok) std::perror("orv_generate");
  return ok ? 0 : 1;
}
