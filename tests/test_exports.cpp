// The export surface as an engine's loader sees it: exactly the routines
// that the catalogue lists, each in code under its undecorated name, and
// the data export as data.  It is read from the library itself, an ELF
// file's dynamic symbols or a loaded DLL's export directory, so that the
// test needs nothing of the platform's tools.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <iterator>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "catalogue/catalogue.hpp"
#include "support/frame_call.hpp"
#include "support/platform.hpp"

#if !defined(_WIN32)
#include <elf.h>
#endif

namespace {

using cli::catalogue::kRoutines;

// The library's own name, and each export with what it is: "code", "data",
// or what else the library says of it.
struct Surface {
  std::string name;
  std::map<std::string, std::string> exports;
};

#if defined(_WIN32)

template <typename T>
T at(const unsigned char *p) {
  T value{};
  std::memcpy(&value, p, sizeof(T));
  return value;
}

// The export directory of the DLL loaded at `base`, where every address is
// an offset from the base: an export lies in code when its section may be
// executed (IMAGE_SCN_MEM_EXECUTE).
Surface exportsOf(const unsigned char *base) {
  const unsigned char *pe = base + at<std::uint32_t>(base + 0x3C);
  const unsigned char *optional = pe + 24;
  EXPECT_EQ(at<std::uint16_t>(optional), 0x20B) << "no PE32+ image";
  const unsigned char *sections = optional + at<std::uint16_t>(pe + 20);
  const auto directory = at<std::uint32_t>(optional + 112);
  const auto directoryEnd = directory + at<std::uint32_t>(optional + 116);
  const auto kind = [&](std::uint32_t rva) -> std::string {
    if (rva >= directory && rva < directoryEnd) return "forwarded";
    for (unsigned i = 0; i < at<std::uint16_t>(pe + 6); ++i) {
      const unsigned char *s = sections + 40 * i;
      const auto address = at<std::uint32_t>(s + 12);
      const auto size = std::max(at<std::uint32_t>(s + 8), at<std::uint32_t>(s + 16));
      const bool code = (at<std::uint32_t>(s + 36) & 0x20000000) != 0;
      if (rva >= address && rva < address + size) return code ? "code" : "data";
    }
    return "nowhere";
  };
  const unsigned char *dir = base + directory;
  const auto text = [&](const unsigned char *rvaAt) {
    return std::string(reinterpret_cast<const char *>(base + at<std::uint32_t>(rvaAt)));
  };
  Surface out{text(dir + 12), {}};
  const auto nameCount = at<std::uint32_t>(dir + 24);
  EXPECT_EQ(at<std::uint32_t>(dir + 20), nameCount) << "exports by ordinal only";
  for (std::uint32_t i = 0; i < nameCount; ++i) {
    const auto ordinal = at<std::uint16_t>(base + at<std::uint32_t>(dir + 36) + 2 * i);
    out.exports[text(base + at<std::uint32_t>(dir + 32) + 4 * i)] =
        kind(at<std::uint32_t>(base + at<std::uint32_t>(dir + 28) + 4 * ordinal));
  }
  return out;
}

#else

// A value at `offset` of `bytes`, or zero beyond their end.
template <typename T>
T readAt(const std::vector<char> &bytes, std::uint64_t offset) {
  T value{};
  if (offset + sizeof(T) <= bytes.size()) std::memcpy(&value, bytes.data() + offset, sizeof(T));
  return value;
}

// The defined, global, default-visibility symbols of an ELF64 file's
// .dynsym, and its DT_SONAME; data is a 4-byte object.
Surface exportsOf(const std::vector<char> &file) {
  Surface out;
  const auto header = readAt<Elf64_Ehdr>(file, 0);
  EXPECT_TRUE(std::memcmp(header.e_ident, ELFMAG, SELFMAG) == 0 &&
              header.e_ident[EI_CLASS] == ELFCLASS64)
      << "no ELF64 file";
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
        const unsigned type = ELF64_ST_TYPE(sym.st_info);
        out.exports[name(sym.st_name)] = type == STT_FUNC                         ? "code"
                                         : type == STT_OBJECT && sym.st_size == 4 ? "data"
                                                                                  : "other";
      }
    } else if (s.sh_type == SHT_DYNAMIC) {
      for (std::uint64_t at = s.sh_offset; at < s.sh_offset + s.sh_size; at += sizeof(Elf64_Dyn)) {
        const auto entry = readAt<Elf64_Dyn>(file, at);
        if (entry.d_tag == DT_SONAME) out.name = name(entry.d_un.d_val);
      }
    }
  }
  return out;
}

#endif

TEST(Exports, AreExactlyTheCataloguedRoutinesAndTheDataExportAsData) {
  void *library = orv::test::openLibrary(ORV_LIBRARY_PATH);
  ASSERT_NE(library, nullptr) << orv::test::loaderError();
#if defined(_WIN32)
  const Surface surface = exportsOf(static_cast<const unsigned char *>(library));
  EXPECT_EQ(surface.name, "ORVCLIFN.dll");
#else
  std::ifstream in(orv::test::libraryFile(library), std::ios::binary);
  const Surface surface = exportsOf({std::istreambuf_iterator<char>(in), {}});
  EXPECT_EQ(surface.name, "liborvclifn.so.1");
#endif
  orv::test::closeLibrary(library);
  // Each routine once, named after its SQL function (with a digit when it
  // has several exports), but the table functions of mixed case.
  const std::set<std::string> mixedCase = {"CLI_udfFmpThreads", "CLI_udfFmpRows",
                                           "SQLCACHE_SNAPSHOT"};
  std::map<std::string, std::string> expected = {{"sqlzThisIsAORVLibrary", "data"}};
  for (const auto &r : kRoutines) {
    EXPECT_TRUE(expected.emplace(r.symbol, "code").second) << r.symbol << " is listed twice";
    const std::string base = "CLI_udf" + std::string(r.sqlName), symbol = r.symbol;
    EXPECT_TRUE(mixedCase.contains(symbol) || symbol == base ||
                (symbol.size() == base.size() + 1 && symbol.starts_with(base) &&
                 std::isdigit(static_cast<unsigned char>(symbol.back()))))
        << symbol << " for " << r.sqlName;
  }
  EXPECT_EQ(surface.exports, expected);
  const auto *mark =
      static_cast<const std::int32_t *>(orv::test::exportAddress("sqlzThisIsAORVLibrary"));
  ASSERT_NE(mark, nullptr);
  EXPECT_EQ(*mark, 0);
}

}  // namespace
