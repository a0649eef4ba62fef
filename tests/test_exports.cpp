// The export surface as an engine's loader sees it: exactly the routines
// that the catalogue lists, and the data export.
#include <gtest/gtest.h>

#include <cctype>
#include <cstring>
#include <fstream>
#include <iterator>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "support/frame_call.hpp"

#if !defined(_WIN32)
#include <elf.h>
#endif

namespace {

using cli::catalogue::kRoutines;

#if defined(_WIN32)

TEST(Exports, AreExactlyTheCataloguedRoutinesAndTheDataExport) {
  GTEST_SKIP() << "reads an ELF file's dynamic symbols; a DLL's exports are checked by "
                  "WindowsExports.AreExactlyTheCataloguedRoutinesAndTheDataExportAsData";
}

#else

struct Symbol {
  unsigned char type;
  std::uint64_t size;
};

template <typename T>
T readAt(const std::vector<char> &file, std::uint64_t offset) {
  T value{};
  if (offset + sizeof(T) <= file.size()) std::memcpy(&value, file.data() + offset, sizeof(T));
  return value;
}

// The defined, global, default-visibility symbols of .dynsym, and DT_SONAME.
std::map<std::string, Symbol> dynamicSymbols(const std::vector<char> &file, std::string &soname) {
  std::map<std::string, Symbol> out;
  const auto header = readAt<Elf64_Ehdr>(file, 0);
  if (std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0 || header.e_ident[EI_CLASS] != ELFCLASS64) {
    return out;
  }
  const auto section = [&](unsigned i) {
    return readAt<Elf64_Shdr>(file, header.e_shoff + std::uint64_t{i} * header.e_shentsize);
  };
  for (unsigned i = 0; i < header.e_shnum; ++i) {
    const Elf64_Shdr s = section(i);
    const Elf64_Shdr strings = section(s.sh_link);
    const auto name = [&](std::uint64_t at) {
      return std::string(file.data() + strings.sh_offset + at);
    };
    if (s.sh_type == SHT_DYNSYM) {
      for (std::uint64_t at = s.sh_offset; at < s.sh_offset + s.sh_size; at += sizeof(Elf64_Sym)) {
        const auto sym = readAt<Elf64_Sym>(file, at);
        if (sym.st_shndx == SHN_UNDEF || ELF64_ST_BIND(sym.st_info) != STB_GLOBAL ||
            ELF64_ST_VISIBILITY(sym.st_other) != STV_DEFAULT) {
          continue;
        }
        out[name(sym.st_name)] = {static_cast<unsigned char>(ELF64_ST_TYPE(sym.st_info)),
                                  sym.st_size};
      }
    } else if (s.sh_type == SHT_DYNAMIC) {
      for (std::uint64_t at = s.sh_offset; at < s.sh_offset + s.sh_size; at += sizeof(Elf64_Dyn)) {
        const auto entry = readAt<Elf64_Dyn>(file, at);
        if (entry.d_tag == DT_SONAME) soname = name(entry.d_un.d_val);
      }
    }
  }
  return out;
}

TEST(Exports, AreExactlyTheCataloguedRoutinesAndTheDataExport) {
  std::ifstream in(ORV_LIBRARY_PATH, std::ios::binary);
  const std::vector<char> file((std::istreambuf_iterator<char>(in)), {});
  std::string soname;
  const auto symbols = dynamicSymbols(file, soname);
  EXPECT_EQ(soname, "liborvclifn.so.1");

  std::set<std::string> expected = {cli::catalogue::kDataExport};
  for (const auto &r : kRoutines) {
    expected.insert(r.symbol);
  }
  std::set<std::string> actual;
  for (const auto &[name, symbol] : symbols) actual.insert(name);
  EXPECT_EQ(actual, expected);

  for (const auto &[name, symbol] : symbols) {
    if (name == cli::catalogue::kDataExport) {
      EXPECT_EQ(symbol.type, STT_OBJECT);
      EXPECT_EQ(symbol.size, 4u);
    } else {
      EXPECT_EQ(symbol.type, STT_FUNC) << name;
    }
  }
  const auto *mark =
      static_cast<const std::int32_t *>(orv::test::exportAddress("sqlzThisIsAORVLibrary"));
  ASSERT_NE(mark, nullptr);
  EXPECT_EQ(*mark, 0);
}

#endif

TEST(Catalogue, NamesEachExportOnceAfterItsSqlFunctionAndFindsIt) {
  const std::set<std::string> mixedCase = {"CLI_udfFmpThreads", "CLI_udfFmpRows",
                                           "SQLCACHE_SNAPSHOT"};
  std::set<std::string> seen;
  for (const auto &r : kRoutines) {
    EXPECT_TRUE(seen.insert(r.symbol).second) << r.symbol << " is listed twice";
    EXPECT_NE(orv::test::exportAddress(r.symbol), nullptr) << r.symbol << " is not found";
    if (mixedCase.contains(r.symbol)) continue;
    const std::string base = "CLI_udf" + std::string(r.sqlName);
    const std::string symbol = r.symbol;
    EXPECT_TRUE(symbol == base || (symbol.size() == base.size() + 1 && symbol.starts_with(base) &&
                                   std::isdigit(static_cast<unsigned char>(symbol.back()))))
        << r.symbol << " for " << r.sqlName;
  }
}

}  // namespace
