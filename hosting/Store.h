// The accounts and their files. Accounts are in DATA/hosting.sqlite, the files are plain files
// DATA/users/FOLDER/NAME (an FTP server is rooted at DATA), mails to users are text files in DATA/outbox.
//
// A change is on the disk when its function returns. The change of a file or folder is one step, so a kill
// leaves the state before it or after it; where a folder and its account change, a repeated call or start
// ends what a kill interrupted. Names and texts are UTF-8. Any thread may call. Failures of disk or database
// throw std::exception.
#pragma once

#include <atomic>
#include <cstdint>
#include <filesystem>
#include <initializer_list>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "hosting/Database.h"
#include "hosting/Files.h"

namespace tarnwick::hosting {

struct Account {
  std::int64_t id = 0;
  std::string name;
  std::string folder;
  std::string password;
  std::string mguid;
  std::int64_t product = 0;
  std::int64_t created = 0;  // seconds since 1970, as is `started`, from which the account's period counts
  std::int64_t started = 0;
};

struct StoredFile {
  std::string name;
  std::uint64_t size = 0;
  std::int64_t date = 0;  // seconds since 1970
};

enum class Change {
  kDone,
  kUnchanged,    // upload: the same bytes were there; rename: only the new name was there
  kNoAccount,    // the account was removed meanwhile
  kFolderState,  // to create a folder: it is there; everything else: it is not
  kNameRefused,  // or taken, or the quota would be exceeded
  kNotThere,
};

enum class Addition { kDone, kTaken, kRefused, kLimitReached };

class Store {
 public:
  // Opens or creates the data folder. One program at a time.
  explicit Store(std::filesystem::path data);

  std::optional<Account> FindByName(std::string_view name);
  std::optional<Account> FindByStrippedName(std::string_view stripped);
  std::optional<Account> FindByMguid(std::string_view mguid);

  // Makes an account with a new password and MGUID, without a folder. `result` is set only when it is done.
  Addition AddAccount(std::string_view name, std::int64_t product, std::int64_t mostAccounts,
                      std::optional<Account>& result);

  // Makes an account with its folder and the regular files of `pictures` (may be empty: none), or with the
  // folder that is there and nobody's. False when another account has the name or the folder.
  bool SeedAccount(std::string_view name, std::string_view password, std::int64_t product,
                   const std::filesystem::path& pictures);

  // Removes the account, its folder and its files.
  void RemoveAccount(const Account& account);

  void SetPassword(const Account& account, std::string_view password);

  // Lets the account's period count from now on.
  void Restart(const Account& account);

  // In the order of the names' bytes.
  std::vector<StoredFile> List(const Account& account);
  std::uint64_t UsedBytes(const Account& account);

  Change CreateFolder(const Account& account);
  Change DeleteFolder(const Account& account);

  // Begins with a file for the bytes; all checks come when they are there.
  std::unique_ptr<TemporaryFile> BeginUpload();
  Change FinishUpload(const Account& account, std::string_view name, std::uint64_t quota,
                      TemporaryFile& bytes);

  Change RenameFile(const Account& account, std::string_view oldName, std::string_view newName);

  // `remember` makes WasDeleted true for the name.
  Change DeleteFile(const Account& account, std::string_view name, bool remember);
  bool WasDeleted(const Account& account, std::string_view name);

  // The bytes of a file of any account; none when there is no such file or the names would leave the folder.
  FileHandle OpenPicture(std::string_view folder, std::string_view name) const;

  // Puts a mail into the outbox.
  void SendMail(std::string_view to, std::string_view subject, std::string_view text);

 private:
  std::filesystem::path FolderPath(const Account& account) const { return users_ / account.folder; }
  std::filesystem::path NewWorkPath();
  // The following expect the mutex to be held.
  bool IsThere(const Account& account);
  // Whether the name or the folder is another account's.
  bool IsAccountTaken(const Account& account);
  // What forbids a change of these files; kDone: nothing.
  Change Obstacle(const Account& account, std::initializer_list<std::string_view> names);
  // Takes the folder out of sight in one step; returns where it is. What is left in the work folder goes when
  // the store is opened.
  std::filesystem::path MoveAway(const Account& account);

  std::filesystem::path data_;
  std::filesystem::path users_;
  std::filesystem::path outbox_;
  std::filesystem::path work_;  // bytes that arrive, folders on their way out; emptied on opening
  FileHandle lock_;
  std::mutex mutex_;  // one change or look-up at a time: guards the database and the folders
  std::unique_ptr<Database> database_;
  std::atomic<std::uint64_t> workNumber_{0};
};

}  // namespace tarnwick::hosting
