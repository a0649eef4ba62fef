// The export table of the Windows DLL as an engine's loader reads it:
// exactly the routines that the catalogue lists, by their
// undecorated names, each in code, and the data export in a section that
// holds no code.  The table is read from the file itself (the PE export
// directory), so the test needs nothing of the platform; in a build that
// makes an ELF library it has nothing to read and is skipped.
#include <gtest/gtest.h>

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

namespace {

using cli::catalogue::kRoutines;

constexpr std::uint32_t kExecute = 0x20000000;  // IMAGE_SCN_MEM_EXECUTE

template <typename T>
T readAt(const std::vector<char> &file, std::uint64_t offset) {
  T value{};
  if (offset + sizeof(T) <= file.size()) std::memcpy(&value, file.data() + offset, sizeof(T));
  return value;
}

struct Section {
  std::string name;
  std::uint32_t address, size, rawOffset, rawSize, flags;
};

struct Exports {
  std::string dllName;
  std::uint32_t functionCount = 0;
  std::map<std::string, std::uint32_t> addresses;  // name to RVA
  std::vector<Section> sections;
  std::uint32_t directory = 0, directorySize = 0;

  const Section *sectionOf(std::uint32_t rva) const {
    for (const Section &s : sections) {
      if (rva >= s.address && rva < s.address + std::max(s.size, s.rawSize)) return &s;
    }
    return nullptr;
  }
};

// The export directory of a PE32+ file; false when the file is no PE32+.
bool readExports(const std::vector<char> &file, Exports &out) {
  if (file.size() < 0x40 || file[0] != 'M' || file[1] != 'Z') return false;
  const auto pe = readAt<std::uint32_t>(file, 0x3C);
  if (readAt<std::uint32_t>(file, pe) != 0x00004550) return false;  // "PE\0\0"
  const std::uint64_t coff = pe + 4;
  const auto sectionCount = readAt<std::uint16_t>(file, coff + 2);
  const auto optionalSize = readAt<std::uint16_t>(file, coff + 16);
  const std::uint64_t optional = coff + 20;
  if (readAt<std::uint16_t>(file, optional) != 0x20B) return false;  // PE32+
  out.directory = readAt<std::uint32_t>(file, optional + 112);
  out.directorySize = readAt<std::uint32_t>(file, optional + 116);
  for (std::uint64_t i = 0, at = optional + optionalSize; i < sectionCount; ++i, at += 40) {
    char name[9] = {};
    std::memcpy(name, file.data() + at, 8);
    out.sections.push_back(
        {name, readAt<std::uint32_t>(file, at + 12), readAt<std::uint32_t>(file, at + 8),
         readAt<std::uint32_t>(file, at + 20), readAt<std::uint32_t>(file, at + 16),
         readAt<std::uint32_t>(file, at + 36)});
  }
  const auto offsetOf = [&](std::uint32_t rva) -> std::uint64_t {
    const Section *s = out.sectionOf(rva);
    return s == nullptr ? file.size() : std::uint64_t{s->rawOffset} + (rva - s->address);
  };
  const auto textAt = [&](std::uint32_t rva) {
    const std::uint64_t at = offsetOf(rva);
    return at < file.size()
               ? std::string(file.data() + at, ::strnlen(file.data() + at, file.size() - at))
               : std::string();
  };
  if (out.directory == 0) return true;
  const std::uint64_t dir = offsetOf(out.directory);
  out.dllName = textAt(readAt<std::uint32_t>(file, dir + 12));
  out.functionCount = readAt<std::uint32_t>(file, dir + 20);
  const auto nameCount = readAt<std::uint32_t>(file, dir + 24);
  const std::uint64_t functions = offsetOf(readAt<std::uint32_t>(file, dir + 28));
  const std::uint64_t names = offsetOf(readAt<std::uint32_t>(file, dir + 32));
  const std::uint64_t ordinals = offsetOf(readAt<std::uint32_t>(file, dir + 36));
  for (std::uint32_t i = 0; i < nameCount; ++i) {
    const auto ordinal = readAt<std::uint16_t>(file, ordinals + 2ULL * i);
    out.addresses[textAt(readAt<std::uint32_t>(file, names + 4ULL * i))] =
        readAt<std::uint32_t>(file, functions + 4ULL * ordinal);
  }
  return true;
}

TEST(WindowsExports, AreExactlyTheCataloguedRoutinesAndTheDataExportAsData) {
  void *library = orv::test::openLibrary(ORV_LIBRARY_PATH);
  ASSERT_NE(library, nullptr) << orv::test::loaderError();
  const std::string path = orv::test::libraryFile(library);
  std::ifstream in(path, std::ios::binary);
  const std::vector<char> file((std::istreambuf_iterator<char>(in)), {});
  ASSERT_FALSE(file.empty()) << path;
  Exports exports;
  if (!readExports(file, exports)) GTEST_SKIP() << path << " is no PE file; the ELF test checks it";

  EXPECT_EQ(exports.dllName, "ORVCLIFN.dll");
  std::set<std::string> expected = {cli::catalogue::kDataExport};
  for (const auto &r : kRoutines) {
    expected.insert(r.symbol);
  }
  std::set<std::string> actual;
  for (const auto &[name, rva] : exports.addresses) actual.insert(name);
  EXPECT_EQ(actual, expected);
  // No export by ordinal only.
  EXPECT_EQ(exports.functionCount, exports.addresses.size());

  for (const auto &[name, rva] : exports.addresses) {
    EXPECT_FALSE(rva >= exports.directory && rva < exports.directory + exports.directorySize)
        << name << " is forwarded";
    const Section *s = exports.sectionOf(rva);
    ASSERT_NE(s, nullptr) << name;
    const bool code = (s->flags & kExecute) != 0;
    if (name == cli::catalogue::kDataExport) {
      EXPECT_FALSE(code) << name << " lies in " << s->name << ", which holds code";
    } else {
      EXPECT_TRUE(code) << name << " lies in " << s->name << ", which holds no code";
    }
  }
  const auto *mark =
      static_cast<const std::int32_t *>(orv::test::exportAddress(cli::catalogue::kDataExport));
  ASSERT_NE(mark, nullptr);
  EXPECT_EQ(*mark, 0);
}

}  // namespace
