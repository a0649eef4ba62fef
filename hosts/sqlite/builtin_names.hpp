// The functions that a connection already has, by name and argument count.
// Include after sqlite3.h or sqlite3ext.h: the same check runs in the
// extension, through SQLite's routine table, and in the tool that writes
// the function reference, against the linked library.
#pragma once

#include <cctype>
#include <set>
#include <string>
#include <utility>

namespace orv::sqlite {

class KnownFunctions {
 public:
  // Reads the connection's function list once, in one statement.
  explicit KnownFunctions(sqlite3 *db) {
    sqlite3_stmt *statement = nullptr;
    if (sqlite3_prepare_v2(db, "SELECT name, narg FROM pragma_function_list", -1, &statement,
                           nullptr) == SQLITE_OK) {
      int rc = SQLITE_ROW;
      while ((rc = sqlite3_step(statement)) == SQLITE_ROW) {
        const auto *name = reinterpret_cast<const char *>(sqlite3_column_text(statement, 0));
        if (name != nullptr) names_.emplace(folded(name), sqlite3_column_int(statement, 1));
      }
      asked_ = rc == SQLITE_DONE;
    }
    sqlite3_finalize(statement);
  }

  // Whether a function of this name (in any case) takes this many
  // arguments; one of variable count (narg -1) takes every count.  When the
  // connection could not be asked, the answer is yes, so that no built-in
  // is ever hidden by one of ours.
  [[nodiscard]] bool has(const char *name, int argumentCount) const {
    const std::string key = folded(name);
    return !asked_ || names_.contains({key, argumentCount}) || names_.contains({key, -1});
  }

 private:
  static std::string folded(const char *name) {
    std::string s(name);
    for (char &c : s) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return s;
  }

  std::set<std::pair<std::string, int>> names_;
  bool asked_ = false;
};

}  // namespace orv::sqlite
