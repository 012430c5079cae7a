#include "hosting/Database.h"

#include <sqlite3.h>

#include <stdexcept>

namespace tarnwick::hosting {
namespace {

// Milliseconds that a change waits for another program's lock. No program but the server needs one, and all
// clients wait meanwhile.
constexpr int kBusyPatience = 500;

[[noreturn]] void Fail(sqlite3* connection) {
  throw std::runtime_error(std::string("database: ") + sqlite3_errmsg(connection));
}

}  // namespace

void Database::Closer::operator()(sqlite3* connection) const {
  sqlite3_close(connection);
}

Database::Database(const std::filesystem::path& path) {
  sqlite3* connection = nullptr;
  const int status = sqlite3_open(path.c_str(), &connection);
  connection_.reset(connection);  // a failed opening makes a connection too, for its message
  if (status != SQLITE_OK) Fail(connection);
  sqlite3_busy_timeout(connection, kBusyPatience);
  Run("PRAGMA journal_mode=WAL; PRAGMA synchronous=FULL; PRAGMA foreign_keys=ON");
}

void Database::Run(const char* sql) {
  if (sqlite3_exec(connection_.get(), sql, nullptr, nullptr, nullptr) != SQLITE_OK) Fail(connection_.get());
}

void Statement::Finalizer::operator()(sqlite3_stmt* statement) const {
  sqlite3_finalize(statement);
}

Statement::Statement(Database& database, const char* sql, Prepare) {
  sqlite3_stmt* statement = nullptr;
  if (sqlite3_prepare_v2(database.connection_.get(), sql, -1, &statement, nullptr) != SQLITE_OK)
    Fail(database.connection_.get());
  statement_.reset(statement);
}

void Statement::Bind(int index, std::string_view text) {
  // The statement keeps a copy: callers bind temporaries.
  const auto keepCopy = reinterpret_cast<sqlite3_destructor_type>(std::intptr_t{-1});
  const char* bytes = text.data() ? text.data() : "";
  if (sqlite3_bind_text64(statement_.get(), index, bytes, text.size(), keepCopy, SQLITE_UTF8) != SQLITE_OK)
    Fail(sqlite3_db_handle(statement_.get()));
}

void Statement::Bind(int index, std::int64_t number) {
  if (sqlite3_bind_int64(statement_.get(), index, number) != SQLITE_OK)
    Fail(sqlite3_db_handle(statement_.get()));
}

bool Statement::Step() {
  const int status = sqlite3_step(statement_.get());
  if (status != SQLITE_ROW && status != SQLITE_DONE) Fail(sqlite3_db_handle(statement_.get()));
  return status == SQLITE_ROW;
}

std::string Statement::TextAt(int column) const {
  const auto* text = reinterpret_cast<const char*>(sqlite3_column_text(statement_.get(), column));
  return text ? std::string(text, static_cast<std::size_t>(sqlite3_column_bytes(statement_.get(), column)))
              : std::string();
}

std::int64_t Statement::NumberAt(int column) const {
  return sqlite3_column_int64(statement_.get(), column);
}

}  // namespace tarnwick::hosting
