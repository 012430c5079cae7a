#include "hosting/Store.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
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
CREATE TABLE IF NOT EXISTS deleted(
  account INTEGER NOT NULL REFERENCES accounts(id) ON DELETE CASCADE,
  name TEXT NOT NULL, PRIMARY KEY(account, name)) WITHOUT ROWID;
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

// The regular files of a folder that may be a user's files; none when there is no such folder.
std::vector<StoredFile> FilesIn(const fs::path& folder) {
  std::vector<StoredFile> files;
  if (!fs::is_directory(folder)) return files;
  for (const fs::directory_entry& entry : fs::directory_iterator(folder)) {
    std::string name = entry.path().filename().string();
    struct stat facts {};
    if (!IsRefusedFileName(name) && lstat(entry.path().c_str(), &facts) == 0 && S_ISREG(facts.st_mode))
      files.push_back({std::move(name), static_cast<std::uint64_t>(facts.st_size), facts.st_mtime});
  }
  return files;
}

// Whether another file than `except` has the name, letter case apart.
bool IsTaken(const std::vector<StoredFile>& files, std::string_view name, std::string_view except) {
  const std::string folded = FoldCase(name);
  return std::any_of(files.begin(), files.end(), [&](const StoredFile& file) {
    return file.name != except && FoldCase(file.name) == folded;
  });
}

// Removes as much of a folder as it can.
void Discard(const fs::path& folder) {
  std::error_code ignored;
  fs::remove_all(folder, ignored);
}

bool IsFile(const fs::path& path) {
  return fs::is_regular_file(fs::symlink_status(path));
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
  {
    // Closed before SQLite opens the file: closing it later would drop SQLite's locks.
    const FileHandle created(open(database.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0600));
  }
  database_ = std::make_unique<Database>(database);
  database_->Run(kSchema);
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
  if (IsAccountTaken(account) || fs::exists(FolderPath(account))) return Addition::kTaken;
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
  if (IsAccountTaken(account)) return false;
  // The folder comes before its account: a kill in between leaves one that the next start takes over.
  if (!fs::exists(FolderPath(account))) {
    const fs::path prepared = NewWorkPath();
    fs::create_directory(prepared);
    if (!pictures.empty())
      for (const StoredFile& file : FilesIn(pictures))
        fs::copy_file(pictures / file.name, prepared / file.name);
    // Much faster for many files than one after the other.
    if (syncfs(lock_.Get()) != 0) throw std::system_error(errno, std::generic_category(), data_.string());
    fs::rename(prepared, FolderPath(account));
    SyncFolder(users_);
  }
  InsertAccount(*database_, account);
  return true;
}

void Store::RemoveAccount(const Account& account) {
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return;  // and its folder may be another one's by now
  // The folder goes first: it would outlive a kill in between without an owner and keep its name taken.
  const fs::path away = fs::exists(FolderPath(account)) ? MoveAway(account) : fs::path();
  try {
    Execute(*database_, "DELETE FROM accounts WHERE id = ?", account.id);
  } catch (...) {
    if (!away.empty()) {
      fs::rename(away, FolderPath(account));
      SyncFolder(users_);
    }
    throw;
  }
  Discard(away);
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
  std::vector<StoredFile> files = FilesIn(FolderPath(account));
  std::sort(files.begin(), files.end(),
            [](const StoredFile& one, const StoredFile& other) { return one.name < other.name; });
  return files;
}

std::uint64_t Store::UsedBytes(const Account& account) {
  const std::lock_guard lock(mutex_);
  std::uint64_t used = 0;
  for (const StoredFile& file : FilesIn(FolderPath(account))) used += file.size;
  return used;
}

Change Store::CreateFolder(const Account& account) {
  const std::lock_guard lock(mutex_);
  if (!IsThere(account)) return Change::kNoAccount;
  if (!fs::create_directory(FolderPath(account))) return Change::kFolderState;
  SyncFolder(users_);
  return Change::kDone;
}

Change Store::DeleteFolder(const Account& account) {
  const std::lock_guard lock(mutex_);
  const Change obstacle = Obstacle(account, {});
  if (obstacle == Change::kDone) Discard(MoveAway(account));
  return obstacle;
}

std::unique_ptr<TemporaryFile> Store::BeginUpload() {
  return std::make_unique<TemporaryFile>(NewWorkPath());
}

Change Store::FinishUpload(const Account& account, std::string_view name, std::uint64_t quota,
                           TemporaryFile& bytes) {
  bytes.Sync();
  const std::lock_guard lock(mutex_);
  if (const Change obstacle = Obstacle(account, {name}); obstacle != Change::kDone) return obstacle;
  const std::vector<StoredFile> files = FilesIn(FolderPath(account));
  if (IsTaken(files, name, name)) return Change::kNameRefused;
  std::uint64_t used = bytes.Size();
  for (const StoredFile& file : files)
    if (file.name != name) used += file.size;
  if (used > quota) return Change::kNameRefused;
  const fs::path path = FolderPath(account) / name;
  if (bytes.HasBytesOf(path)) return Change::kUnchanged;
  bytes.MoveTo(path);
  return Change::kDone;
}

Change Store::RenameFile(const Account& account, std::string_view oldName, std::string_view newName) {
  const std::lock_guard lock(mutex_);
  if (const Change obstacle = Obstacle(account, {oldName, newName}); obstacle != Change::kDone)
    return obstacle;
  const fs::path folder = FolderPath(account);
  if (!IsFile(folder / oldName)) return IsFile(folder / newName) ? Change::kUnchanged : Change::kNotThere;
  if (IsTaken(FilesIn(folder), newName, oldName)) return Change::kNameRefused;
  fs::rename(folder / oldName, folder / newName);
  SyncFolder(folder);
  return Change::kDone;
}

Change Store::DeleteFile(const Account& account, std::string_view name, bool remember) {
  const std::lock_guard lock(mutex_);
  if (const Change obstacle = Obstacle(account, {name}); obstacle != Change::kDone) return obstacle;
  const fs::path folder = FolderPath(account);
  if (!IsFile(folder / name)) return Change::kNotThere;
  if (remember)
    Execute(*database_, "INSERT OR IGNORE INTO deleted(account, name) VALUES(?, ?)", account.id, name);
  fs::remove(folder / name);
  SyncFolder(folder);
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
  std::error_code ignored;  // of a name that is too long, say; opening fails then too
  if (leaves || IsRefusedFileName(name) || fs::is_symlink(users_ / folder, ignored)) return {};
  return OpenRegularFile(users_ / folder / name);
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

bool Store::IsAccountTaken(const Account& account) {
  return Statement(*database_, "SELECT 1 FROM accounts WHERE stripped = ? OR folder = ?", Strip(account.name),
                   account.folder)
      .Step();
}

Change Store::Obstacle(const Account& account, std::initializer_list<std::string_view> names) {
  if (!IsThere(account)) return Change::kNoAccount;
  if (!fs::is_directory(FolderPath(account))) return Change::kFolderState;
  return std::any_of(names.begin(), names.end(), IsRefusedFileName) ? Change::kNameRefused : Change::kDone;
}

fs::path Store::MoveAway(const Account& account) {
  fs::path away = NewWorkPath();
  fs::rename(FolderPath(account), away);
  SyncFolder(users_);
  return away;
}

}  // namespace tarnwick::hosting
