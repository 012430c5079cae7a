// A SQLite database, as far as the store needs one. Every failure throws std::runtime_error. Not for several
// threads at once.
#pragma once

#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>
#include <string_view>

struct sqlite3;
struct sqlite3_stmt;

namespace tarnwick::hosting {

class Database {
 public:
  // Opens or creates the file; every commit is on the disk when it returns.
  explicit Database(const std::filesystem::path& path);

  // Runs statements without parameters or rows.
  void Run(const char* sql);

 private:
  friend class Statement;
  struct Closer {
    void operator()(sqlite3* connection) const;
  };
  std::unique_ptr<sqlite3, Closer> connection_;
};

// One prepared statement with its parameters, which are bound in the order of the question marks.
class Statement {
 public:
  template <typename... Values>
  Statement(Database& database, const char* sql, const Values&... values)
      : Statement(database, sql, Prepare{}) {
    int index = 0;
    (Bind(++index, values), ...);
  }

  // Advances to the next row; false when there is none.
  bool Step();

  // Columns of the row, from 0.
  std::string TextAt(int column) const;
  std::int64_t NumberAt(int column) const;

 private:
  struct Prepare {};
  Statement(Database& database, const char* sql, Prepare);
  void Bind(int index, std::string_view text);
  void Bind(int index, std::int64_t number);

  struct Finalizer {
    void operator()(sqlite3_stmt* statement) const;
  };
  std::unique_ptr<sqlite3_stmt, Finalizer> statement_;
};

// Runs one statement that has no rows.
template <typename... Values>
void Execute(Database& database, const char* sql, const Values&... values) {
  Statement(database, sql, values...).Step();
}

}  // namespace tarnwick::hosting
