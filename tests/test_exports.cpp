// The export surface as an engine's loader sees it, read from the library
// file itself (an ELF file's dynamic symbols, or a PE file's export
// directory), so that the test needs nothing of the platform: exactly the
// routines that the catalogue lists, each in code under its undecorated
// name, and the data export as data.
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

template <typename T>
T readAt(const std::vector<char> &file, std::uint64_t offset) {
  T value{};
  if (offset + sizeof(T) <= file.size()) std::memcpy(&value, file.data() + offset, sizeof(T));
  return value;
}

// The library's own name, and each export with what it is: "code", "data",
// or what else the file says of it.
struct Surface {
  std::string name;
  std::map<std::string, std::string> exports;
};

#if !defined(_WIN32)

// The defined, global, default-visibility symbols of .dynsym, and
// DT_SONAME; data is a 4-byte object.  False when the file is no ELF64.
bool readElf(const std::vector<char> &file, Surface &out) {
  const auto header = readAt<Elf64_Ehdr>(file, 0);
  if (std::memcmp(header.e_ident, ELFMAG, SELFMAG) != 0 || header.e_ident[EI_CLASS] != ELFCLASS64) {
    return false;
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
        const unsigned type = ELF64_ST_TYPE(sym.st_info);
        out.exports[name(sym.st_name)] =
            type == STT_FUNC ? "code"
            : type == STT_OBJECT && sym.st_size == 4
                ? "data"
                : "type " + std::to_string(type) + " of " + std::to_string(sym.st_size) + " bytes";
      }
    } else if (s.sh_type == SHT_DYNAMIC) {
      for (std::uint64_t at = s.sh_offset; at < s.sh_offset + s.sh_size; at += sizeof(Elf64_Dyn)) {
        const auto entry = readAt<Elf64_Dyn>(file, at);
        if (entry.d_tag == DT_SONAME) out.name = name(entry.d_un.d_val);
      }
    }
  }
  return true;
}

#endif

// The export directory of a PE32+ file: an export lies in code when its
// section may be executed.  False when the file is no PE32+.
bool readPe(const std::vector<char> &file, Surface &out) {
  if (file.size() < 0x40 || file[0] != 'M' || file[1] != 'Z') return false;
  const auto pe = readAt<std::uint32_t>(file, 0x3C);
  if (readAt<std::uint32_t>(file, pe) != 0x00004550) return false;  // "PE\0\0"
  const std::uint64_t coff = pe + 4, optional = coff + 20;
  if (readAt<std::uint16_t>(file, optional) != 0x20B) return false;  // PE32+
  struct Section {
    std::uint32_t address, size, rawOffset, flags;
  };
  std::vector<Section> sections;
  const auto sectionCount = readAt<std::uint16_t>(file, coff + 2);
  for (std::uint64_t i = 0, at = optional + readAt<std::uint16_t>(file, coff + 16);
       i < sectionCount; ++i, at += 40) {
    sections.push_back(
        {readAt<std::uint32_t>(file, at + 12),
         std::max(readAt<std::uint32_t>(file, at + 8), readAt<std::uint32_t>(file, at + 16)),
         readAt<std::uint32_t>(file, at + 20), readAt<std::uint32_t>(file, at + 36)});
  }
  const auto sectionOf = [&](std::uint32_t rva) -> const Section * {
    for (const Section &s : sections) {
      if (rva >= s.address && rva < s.address + s.size) return &s;
    }
    return nullptr;
  };
  const auto offsetOf = [&](std::uint32_t rva) -> std::uint64_t {
    const Section *s = sectionOf(rva);
    return s == nullptr ? file.size() : std::uint64_t{s->rawOffset} + (rva - s->address);
  };
  const auto textAt = [&](std::uint32_t rva) {
    const std::uint64_t at = offsetOf(rva);
    return at < file.size()
               ? std::string(file.data() + at, ::strnlen(file.data() + at, file.size() - at))
               : std::string();
  };
  const auto directory = readAt<std::uint32_t>(file, optional + 112);
  const auto directorySize = readAt<std::uint32_t>(file, optional + 116);
  if (directory == 0) return true;
  const std::uint64_t dir = offsetOf(directory);
  out.name = textAt(readAt<std::uint32_t>(file, dir + 12));
  const auto nameCount = readAt<std::uint32_t>(file, dir + 24);
  EXPECT_EQ(readAt<std::uint32_t>(file, dir + 20), nameCount) << "exports by ordinal only";
  const std::uint64_t functions = offsetOf(readAt<std::uint32_t>(file, dir + 28));
  const std::uint64_t names = offsetOf(readAt<std::uint32_t>(file, dir + 32));
  const std::uint64_t ordinals = offsetOf(readAt<std::uint32_t>(file, dir + 36));
  for (std::uint32_t i = 0; i < nameCount; ++i) {
    const auto ordinal = readAt<std::uint16_t>(file, ordinals + 2ULL * i);
    const auto rva = readAt<std::uint32_t>(file, functions + 4ULL * ordinal);
    const Section *s = sectionOf(rva);
    out.exports[textAt(readAt<std::uint32_t>(file, names + 4ULL * i))] =
        rva >= directory && rva < directory + directorySize ? "forwarded"
        : s == nullptr                                      ? "nowhere"
        : (s->flags & 0x20000000) != 0                      ? "code"  // IMAGE_SCN_MEM_EXECUTE
                                                            : "data";
  }
  return true;
}

TEST(Exports, AreExactlyTheCataloguedRoutinesAndTheDataExportAsData) {
  void *library = orv::test::openLibrary(ORV_LIBRARY_PATH);
  ASSERT_NE(library, nullptr) << orv::test::loaderError();
  const std::string path = orv::test::libraryFile(library);
  orv::test::closeLibrary(library);
  std::ifstream in(path, std::ios::binary);
  const std::vector<char> file((std::istreambuf_iterator<char>(in)), {});
  Surface surface;
  const bool pe = readPe(file, surface);
#if !defined(_WIN32)
  ASSERT_TRUE(pe || readElf(file, surface)) << path << " is no PE32+ or ELF64 file";
#else
  ASSERT_TRUE(pe) << path << " is no PE32+ file";
#endif
  EXPECT_EQ(surface.name, pe ? "ORVCLIFN.dll" : "liborvclifn.so.1");
  std::map<std::string, std::string> expected = {{"sqlzThisIsAORVLibrary", "data"}};
  for (const auto &r : kRoutines) expected[r.symbol] = "code";
  EXPECT_EQ(surface.exports, expected);
  const auto *mark =
      static_cast<const std::int32_t *>(orv::test::exportAddress("sqlzThisIsAORVLibrary"));
  ASSERT_NE(mark, nullptr);
  EXPECT_EQ(*mark, 0);
}

TEST(Catalogue, NamesEachExportOnceAfterItsSqlFunction) {
  const std::set<std::string> mixedCase = {"CLI_udfFmpThreads", "CLI_udfFmpRows",
                                           "SQLCACHE_SNAPSHOT"};
  std::set<std::string> seen;
  for (const auto &r : kRoutines) {
    EXPECT_TRUE(seen.insert(r.symbol).second) << r.symbol << " is listed twice";
    if (mixedCase.contains(r.symbol)) continue;
    const std::string base = "CLI_udf" + std::string(r.sqlName);
    const std::string symbol = r.symbol;
    EXPECT_TRUE(symbol == base || (symbol.size() == base.size() + 1 && symbol.starts_with(base) &&
                                   std::isdigit(static_cast<unsigned char>(symbol.back()))))
        << r.symbol << " for " << r.sqlName;
  }
}

}  // namespace
