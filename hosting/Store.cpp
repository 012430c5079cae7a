#include "hosting/Store.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>

#include <array>
#include <cerrno>
#include <chrono>
#include <map>
#include <stdexcept>
#include <system_error>

#include "hosting/Names.h"

namespace tarnwick::hosting {
namespace {

namespace fs = std::filesystem;

constexpr const char* kSchema = R"(
CREATE TABLE IF NOT EXISTS accounts(
  id INTEGER PRIMARY KEY AUTOINCREMENT,
  name TEXT NOT NULL UNIQUE, stripped TEXT NOT NULL UNIQUE, folder TEXT NOT NULL UNIQUE,
  password TEXT NOT NULL, mguid TEXT NOT NULL UNIQUE, product INTEGER NOT NULL,
  created INTEGER NOT NULL, started INTEGER NOT NULL);
CREATE TABLE IF NOT EXISTS files(
  account INTEGER NOT NULL REFERENCES accounts(id) ON DELETE CASCADE,
  name TEXT NOT NULL, folded TEXT NOT NULL, size INTEGER NOT NULL, date INTEGER NOT NULL,
  PRIMARY KEY(account, name)) WITHOUT ROWID;
CREATE INDEX IF NOT EXISTS files_folded ON files(account, folded);
CREATE TABLE IF NOT EXISTS deleted(
  account INTEGER NOT NULL REFERENCES accounts(id) ON DELETE CASCADE,
  name TEXT NOT NULL, PRIMARY KEY(account, name)) WITHOUT ROWID;
CREATE TABLE IF NOT EXISTS doomed(folder TEXT PRIMARY KEY) WITHOUT ROWID;
)";

constexpr std::string_view kLettersAndDigits =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";

std::int64_t Now() {
  return std::chrono::duration_cast<std::chrono::seconds>(std::chrono::system_clock::now().time_since_epoch())
      .count();
}

template <std::size_t kCount>
std::array<unsigned char, kCount> RandomBytes() {
  std::array<unsigned char, kCount> bytes{};
  if (getrandom(bytes.data(), bytes.size(), 0) != static_cast<ssize_t>(bytes.size()))
    throw std::runtime_error("no random numbers");
  return bytes;
}

std::string NewPassword() {
  std::string password;
  for (const unsigned char byte : RandomBytes<12>())
    password += kLettersAndDigits[byte % kLettersAndDigits.size()];
  return password;
}

std::string NewMguid() {
  constexpr std::string_view kHex = "0123456789ABCDEF";
  std::string guid;
  for (const unsigned char byte : RandomBytes<16>()) {
    if (guid.size() == 8 || guid.size() == 13 || guid.size() == 18 || guid.size() == 23) guid += '-';
    guid += kHex[byte >> 4];
    guid += kHex[byte & 0xF];
  }
  return guid;
}

std::optional<Account> FindAccount(Database& database, const char* column, std::string_view value) {
  const std::string sql =
      std::string("SELECT id, name, folder, password, mguid, product, created, started FROM accounts WHERE ")
          .append(column)
          .append(" = ?");
  Statement statement(database, sql.c_str(), value);
  if (!statement.Step()) return std::nullopt;
  Account account;
  account.id = statement.NumberAt(0);
  account.name = statement.TextAt(1);
  account.folder = statement.TextAt(2);
  account.password = statement.TextAt(3);
  account.mguid = statement.TextAt(4);
  account.product = statement.NumberAt(5);
  account.created = statement.NumberAt(6);
  account.started = statement.NumberAt(7);
  return account;
}

void InsertAccount(Database& database, const Account& account) {
  Execute(database,
          "INSERT INTO accounts(name, stripped, folder, password, mguid, product, created, started)"
          " VALUES(?, ?, ?, ?, ?, ?, ?, ?)",
          account.name, Strip(account.name), account.folder, account.password, account.mguid, account.product,
          account.created, account.started);
}

Account NewAccount(std::string_view name, std::string_view password, std::int64_t product) {
  Account account;
  account.name = name;
  account.folder = FolderOf(name);
  account.password = password;
  account.mguid = NewMguid();
  account.product = product;
  account.created = account.started = Now();
  return account;
}

// The regular files of a folder that may be a user's files, by name.
std::map<std::string, FileFacts> FilesIn(const fs::path& folder) {
  std::map<std::string, FileFacts> files;
  std::error_code none;
  for (const fs::directory_entry& entry : fs::directory_iterator(folder, none)) {
    const std::string name = entry.path().filename().string();
    if (IsRefusedFileName(name)) continue;
    if (const FileHandle file = OpenRegularFile(entry.path())) files.emplace(name, FactsOf(file));
  }
  return files;
}

}  // namespace

Store::Store(fs::path data)
    : data_(std::move(data)), users_(data_ / "users"), outbox_(data_ / "outbox"), work_(data_ / "work") {
  fs::create_directories(data_);
  lock_ = FileHandle(open(data_.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
  if (!lock_) throw std::system_error(errno, std::generic_category(), data_.string());
  if (flock(lock_.Get(), LOCK_EX | LOCK_NB) != 0)
    throw std::runtime_error(data_.string() + " is in use by another server");
  for (const fs::path& folder : {users_, outbox_, work_}) fs::create_directories(folder);
  for (const fs::directory_entry& leftover : fs::directory_iterator(work_)) fs::remove_all(leftover.path());
  // Keys are in the mails and in the database (whose helper files take over its rights): for the owner alone.
  fs::permissions(outbox_, fs::perms::owner_all);
  const fs::path database = data_ / "hosting.sqlite";
  FileHandle(open(database.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
  database_ = std::make_unique<Database>(database);
  database_->Run(kSchema);
  Recover();
  SyncFolder(data_);
}

std::optional<Account> Store::FindByName(std::string_view name) {
  const std::lock_guard lock(mutex_);
  return FindAccount(*database_, "name", name);
}

std::optional<Account> Store::FindByStrippedName(std::string_view stripped) {
  const std::lock_guard lock(mutex_);
  return FindAccount(*database_, "stripped", stripped);
}

std::optional<Account> Store::FindByMguid(std::string_view mguid) {
  const std::lock_guard lock(mutex_);
  return FindAccount(*database_, "mguid", mguid);
}

Addition Store::AddAccount(std::string_view name, std::int64_t product, std::int64_t mostAccounts,
                           std::optional<Account>& result) {
  if (IsRefusedUserName(name)) return Addition::kRefused;
  const Account account = NewAccount(name, NewPassword(), product);
  const std::lock_guard lock(mutex_);
  Statement taken(*database_, "SELECT 1 FROM accounts WHERE stripped = ? OR folder = ?", Strip(name),
                  account.folder);
  if (taken.Step() || fs::exists(FolderPath(account.folder))) return Addition::kTaken;
  Statement count(*database_, "SELECT COUNT(*) FROM accounts");
  if (count.Step() && count.NumberAt(0) >= mostAccounts) return Addition::kLimitReached;
  InsertAccount(*database_, account);
  result = account;
  return Addition::kDone;
}

bool Store::SeedAccount(std::string_view name, std::string_view password, std::int64_t product,
                        const fs::path& pictures) {
  const Account account = NewAccount(name, password, product);
  const std::lock_guard lock(mutex_);
  Statement taken(*database_, "SELECT 1 FROM accounts WHERE stripped = ? OR folder = ?", Strip(name),
                  account.folder);
  if (taken.Step() || fs::exists(FolderPath(account.folder))) return false;

  const fs::path prepared = NewWorkPath();
  fs::create_directory(prepared);
  if (!pictures.empty()) {
    for (const auto& [fileName, facts] : FilesIn(pictures))
      fs::copy_file(pictures / fileName, prepared / fileName);
    SyncFileSystem(prepared);
  }
  // Doomed until the account is there: a kill in between leaves no folder that nobody owns.
  Execute(*database_, "INSERT INTO doomed(folder) VALUES(?)", account.folder);
  fs::rename(prepared, FolderPath(account.folder));
  SyncFolder(users_);
  Transaction transaction(*database_);
  InsertAccount(*database_, account);
  Statement id(*database_, "SELECT id FROM accounts WHERE name = ?", name);
  id.Step();
  for (const auto& [fileName, facts] : FilesIn(FolderPath(account.folder)))
    PutRow(id.NumberAt(0), {fileName, facts.size, facts.date});
  Execute(*database_, "DELETE FROM doomed WHERE folder = ?", account.folder);
  transaction.Commit();
  return true;
}

void Store::RemoveAccount(const Account& account) {
  const std::lock_guard lock(mutex_);
  Transaction transaction(*database_);
  Execute(*database_, "DELETE FROM accounts WHERE id = ?", account.id);
  Execute(*database_, "INSERT OR IGNORE INTO doomed(folder) VALUES(?)", account.folder);
  transaction.Commit();
  RemoveDoomed(account.folder);
}

void Store::SetPassword(const Account& account, std::string_view password) {
  const std::lock_guard lock(mutex_);
  Execute(*database_, "UPDATE accounts SET password = ? WHERE id = ?", password, account.id);
}

void Store::Restart(const Account& account) {
  const std::lock_guard lock(mutex_);
  Execute(*database_, "UPDATE accounts SET started = ? WHERE id = ?", Now(), account.id);
}

std::vector<StoredFile> Store::List(const Account& account) {
  const std::lock_guard lock(mutex_);
  std::vector<StoredFile> files;
  Statement rows(*database_, "SELECT name, size, date FROM files WHERE account = ? ORDER BY name",
                 account.id);
  while (rows.Step())
    files.push_back({rows.TextAt(0), static_cast<std::uint64_t>(rows.NumberAt(1)), rows.NumberAt(2)});
  return files;
}

std::uint64_t Store::UsedBytes(const Account& account) {
  const std::lock_guard lock(mutex_);
  Statement sum(*database_, "SELECT SUM(size) FROM files WHERE account = ?", account.id);
  return sum.Step() ? static_cast<std::uint64_t>(sum.NumberAt(0)) : 0;
}

bool Store::HasFolder(const Account& account) {
  const std::lock_guard lock(mutex_);
  return fs::is_directory(FolderPath(account.folder));
}

Change Store::CreateFolder(const Account& account) {
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return Change::kNoAccount;
  if (!fs::create_directory(FolderPath(account.folder))) return Change::kFolderState;
  SyncFolder(users_);
  return Change::kDone;
}

Change Store::DeleteFolder(const Account& account) {
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return Change::kNoAccount;
  if (!fs::is_directory(FolderPath(account.folder))) return Change::kFolderState;
  Transaction transaction(*database_);
  Execute(*database_, "DELETE FROM files WHERE account = ?", account.id);
  Execute(*database_, "INSERT OR IGNORE INTO doomed(folder) VALUES(?)", account.folder);
  transaction.Commit();
  RemoveDoomed(account.folder);
  return Change::kDone;
}

std::uint64_t Store::RoomFor(const Account& account, std::string_view name, std::uint64_t quota) {
  const std::lock_guard lock(mutex_);
  return Room(account, name, quota);
}

std::unique_ptr<TemporaryFile> Store::BeginUpload() {
  return std::make_unique<TemporaryFile>(NewWorkPath());
}

Change Store::FinishUpload(const Account& account, std::string_view name, std::uint64_t quota,
                           TemporaryFile& bytes) {
  if (IsRefusedFileName(name)) return Change::kNameRefused;
  const FileFacts facts = bytes.Sync();
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return Change::kNoAccount;
  const fs::path folder = FolderPath(account.folder);
  if (!fs::is_directory(folder)) return Change::kFolderState;
  if (IsTakenByOther(account, name, name) || facts.size > Room(account, name, quota))
    return Change::kNameRefused;
  const auto old = Row(account, name);
  if (old && old->size == facts.size && bytes.HasBytesOf(folder / name)) return Change::kUnchanged;
  bytes.MoveTo(folder / name);
  Transaction transaction(*database_);
  PutRow(account.id, {std::string(name), facts.size, facts.date});
  transaction.Commit();
  return Change::kDone;
}

Change Store::RenameFile(const Account& account, std::string_view oldName, std::string_view newName) {
  if (IsRefusedFileName(oldName) || IsRefusedFileName(newName)) return Change::kNameRefused;
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return Change::kNoAccount;
  const fs::path folder = FolderPath(account.folder);
  if (!fs::is_directory(folder)) return Change::kFolderState;
  const auto file = Row(account, oldName);
  if (!file) return Row(account, newName) ? Change::kUnchanged : Change::kNotThere;
  if (oldName == newName) return Change::kDone;
  if (IsTakenByOther(account, newName, oldName)) return Change::kNameRefused;
  fs::rename(folder / oldName, folder / newName);
  SyncFolder(folder);
  Transaction transaction(*database_);
  Execute(*database_, "DELETE FROM files WHERE account = ? AND name = ?", account.id, oldName);
  PutRow(account.id, {std::string(newName), file->size, file->date});
  transaction.Commit();
  return Change::kDone;
}

Change Store::DeleteFile(const Account& account, std::string_view name, bool remember) {
  if (IsRefusedFileName(name)) return Change::kNameRefused;
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return Change::kNoAccount;
  const fs::path folder = FolderPath(account.folder);
  if (!fs::is_directory(folder)) return Change::kFolderState;
  if (!Row(account, name)) return Change::kNotThere;
  fs::remove(folder / name);
  SyncFolder(folder);
  Transaction transaction(*database_);
  Execute(*database_, "DELETE FROM files WHERE account = ? AND name = ?", account.id, name);
  if (remember)
    Execute(*database_, "INSERT OR IGNORE INTO deleted(account, name) VALUES(?, ?)", account.id, name);
  transaction.Commit();
  return Change::kDone;
}

bool Store::WasDeleted(const Account& account, std::string_view name) {
  const std::lock_guard lock(mutex_);
  return Statement(*database_, "SELECT 1 FROM deleted WHERE account = ? AND name = ?", account.id, name)
      .Step();
}

FileHandle Store::OpenPicture(std::string_view folder, std::string_view name) const {
  const bool leaves = folder.empty() || folder == "." || folder == ".." ||
                      folder.find_first_of(std::string_view("/\0", 2)) != std::string_view::npos;
  if (leaves || IsRefusedFileName(name) || fs::is_symlink(FolderPath(folder))) return {};
  return OpenRegularFile(FolderPath(folder) / name);
}

void Store::SendMail(std::string_view to, std::string_view subject, std::string_view text) {
  TemporaryFile mail(NewWorkPath());
  mail.Append(
      std::string("To: ").append(to).append("\nSubject: ").append(subject).append("\n\n").append(text));
  mail.Sync();
  mail.MoveTo(outbox_ / (std::to_string(Now()) + "-" + NewMguid() + ".txt"));
}

fs::path Store::NewWorkPath() {
  return work_ / std::to_string(++workNumber_);
}

bool Store::IsThere(const Account& account) {
  return Statement(*database_, "SELECT 1 FROM accounts WHERE id = ?", account.id).Step();
}

std::uint64_t Store::Room(const Account& account, std::string_view name, std::uint64_t quota) {
  Statement sum(*database_, "SELECT SUM(size) FROM files WHERE account = ? AND name <> ?", account.id, name);
  const std::uint64_t others = sum.Step() ? static_cast<std::uint64_t>(sum.NumberAt(0)) : 0;
  return quota > others ? quota - others : 0;
}

std::optional<StoredFile> Store::Row(const Account& account, std::string_view name) {
  Statement row(*database_, "SELECT size, date FROM files WHERE account = ? AND name = ?", account.id, name);
  if (!row.Step()) return std::nullopt;
  return StoredFile{std::string(name), static_cast<std::uint64_t>(row.NumberAt(0)), row.NumberAt(1)};
}

bool Store::IsTakenByOther(const Account& account, std::string_view name, std::string_view exceptName) {
  return Statement(*database_, "SELECT 1 FROM files WHERE account = ? AND folded = ? AND name <> ?",
                   account.id, FoldCase(name), exceptName)
      .Step();
}

void Store::PutRow(std::int64_t account, const StoredFile& file) {
  Execute(*database_, "INSERT OR REPLACE INTO files(account, name, folded, size, date) VALUES(?, ?, ?, ?, ?)",
          account, file.name, FoldCase(file.name), static_cast<std::int64_t>(file.size), file.date);
  Execute(*database_, "DELETE FROM deleted WHERE account = ? AND name = ?", account, file.name);
}

void Store::RemoveDoomed(const std::string& folder) {
  // Out of sight in one step; what a kill leaves in the work folder goes when the store is opened.
  const fs::path away = NewWorkPath();
  std::error_code absent;
  fs::rename(FolderPath(folder), away, absent);
  SyncFolder(users_);
  Execute(*database_, "DELETE FROM doomed WHERE folder = ?", folder);
  fs::remove_all(away);
}

void Store::Recover() {
  std::vector<std::string> doomed;
  for (Statement rows(*database_, "SELECT folder FROM doomed"); rows.Step();)
    doomed.push_back(rows.TextAt(0));
  for (const std::string& folder : doomed) RemoveDoomed(folder);

  std::vector<std::pair<std::int64_t, std::string>> accounts;
  for (Statement rows(*database_, "SELECT id, folder FROM accounts"); rows.Step();)
    accounts.emplace_back(rows.NumberAt(0), rows.TextAt(1));
  Transaction transaction(*database_);
  for (const auto& [account, folder] : accounts) Reconcile(account, FolderPath(folder));
  transaction.Commit();
}

void Store::Reconcile(std::int64_t account, const fs::path& folder) {
  std::map<std::string, FileFacts> files = FilesIn(folder);
  std::vector<std::string> gone;
  Statement rows(*database_, "SELECT name, size, date FROM files WHERE account = ?", account);
  while (rows.Step()) {
    const auto file = files.find(rows.TextAt(0));
    if (file == files.end())
      gone.push_back(rows.TextAt(0));
    else if (static_cast<std::int64_t>(file->second.size) == rows.NumberAt(1) &&
             file->second.date == rows.NumberAt(2))
      files.erase(file);
  }
  for (const std::string& name : gone) {
    Execute(*database_, "DELETE FROM files WHERE account = ? AND name = ?", account, name);
    Execute(*database_, "INSERT OR IGNORE INTO deleted(account, name) VALUES(?, ?)", account, name);
  }
  for (const auto& [name, facts] : files) PutRow(account, {name, facts.size, facts.date});
}

}  // namespace tarnwick::hosting
