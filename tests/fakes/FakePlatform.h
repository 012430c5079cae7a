// Scripted doubles behind the platform seam. They record what they were asked, in order.
#pragma once

#include <algorithm>
#include <cstring>
#include <deque>
#include <functional>
#include <map>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "base/RuntimeError.h"
#include "platform/FileSystem.h"
#include "platform/HttpTransport.h"
#include "platform/Internet.h"
#include "platform/Platform.h"
#include "platform/Registry.h"
#include "platform/StringResources.h"
#include "session/Apartment.h"

namespace tarnwick {

// The number of the failure that `call` ends with, 0 for none.
template <typename Call>
std::int32_t ErrorOf(const Call& call) {
  try {
    call();
  } catch (const RuntimeError& failure) {
    return failure.Number();
  }
  return 0;
}

inline std::string NamesOf(const FileList& files) {
  std::string names;
  for (std::size_t i = 1; i <= files.Count(); ++i) names += Utf8FromText(Text(files.At(i)->FileName)) + ",";
  return names;
}

// Answers posts with the queued bodies; a post without one is a failed connection.
struct FakeHttp : HttpTransport {
  struct Sent {
    bool secure;
    Text host;
    std::uint16_t port;
    std::string target;
    std::string contentType;
    std::string body;
    std::size_t maxBodyBytes;
  };
  std::deque<std::optional<HttpAnswer>> answers;
  std::vector<Sent> sent;
  // Called with each post before it is answered.
  std::function<void(const Sent&)> onPost;
  std::int32_t failure = 0;

  std::optional<HttpAnswer> Post(const HttpPost& post, std::size_t maxBodyBytes) override {
    sent.push_back({post.secure, post.host, post.port, post.target, std::string(post.contentType),
                    std::string(post.body), maxBodyBytes});
    if (onPost) onPost(sent.back());
    if (answers.empty()) return std::nullopt;
    std::optional<HttpAnswer> answer = std::move(answers.front());
    answers.pop_front();
    return answer;
  }
  std::int32_t LastFailure() const override { return failure; }
  // Answered like a post; status 0 stands for an answer that is cut after these bytes.
  std::optional<int> Get(const HttpGet& get, std::uint64_t most, const Sink& sink) override {
    HttpPost post;
    post.secure = true;
    post.host = get.host;
    post.port = get.port;
    post.target = get.target;
    const auto answer = Post(post, static_cast<std::size_t>(most));
    if (!answer || !sink(answer->body) || answer->status == 0) return std::nullopt;
    return answer->status;
  }
  // Takes the body in pieces of this size, each but for its last byte first, and is answered like any post.
  std::size_t piece = SIZE_MAX;
  std::optional<HttpAnswer> PostStream(const HttpPost& post, BodySource& source,
                                       std::size_t maxBodyBytes) override {
    source.Sent(0);
    if (!source.IsWanted()) return std::nullopt;
    std::string room(std::min(piece, static_cast<std::size_t>(source.Length())), '\0');
    std::string body;
    while (body.size() < source.Length()) {
      body.append(room, 0, source.Read(room));
      source.Sent(body.size() - 1);
      if (!source.IsWanted()) return std::nullopt;
    }
    if (source.Read(room) != 0) throw std::logic_error("a body beyond its length");
    source.Sent(body.size());
    HttpPost whole = post;
    whole.body = body;
    return Post(whole, maxBodyBytes);
  }
};

struct FakeRegistry : Registry {
  struct Value {
    std::uint32_t type;
    std::string bytes;
  };
  using Values = std::map<Text, Value>;
  // By path below HKEY_CURRENT_USER, the only hive with keys.
  std::map<Text, Values> keys;
  int opened = 0;

  struct Key : RegistryKey {
    explicit Key(const Values& itsValues) : values(itsValues) {}
    std::uint32_t Query(TextView name, std::uint32_t& type, std::span<std::uint8_t> data,
                        std::uint32_t& size) override {
      const auto value = values.find(Text(name));
      if (value == values.end()) return 2;
      type = value->second.type;
      size = static_cast<std::uint32_t>(value->second.bytes.size());
      if (size > data.size()) return 234;
      std::memcpy(data.data(), value->second.bytes.data(), size);
      return 0;
    }
    const Values& values;
  };

  std::uint32_t Open(std::uint32_t hive, TextView path, std::unique_ptr<RegistryKey>& key) override {
    ++opened;
    const auto found = keys.find(Text(path));
    if (hive != kHiveCurrentUser || found == keys.end()) return 2;
    key = std::make_unique<Key>(found->second);
    return 0;
  }
  Text TextFromAnsi(std::string_view bytes) const override { return TextFromLatin1(bytes); }

  // A text value, stored with its terminator.
  static Value String(const std::string& text) { return {1, text + '\0'}; }
  static Value Number(unsigned char number) {
    return {4, std::string(1, static_cast<char>(number)) + std::string(3, '\0')};
  }
  Values& InternetSettings() {
    return keys[u"Software\\Microsoft\\Windows\\CurrentVersion\\Internet Settings"];
  }
};

struct FakeFiles : FileSystem {
  struct File {
    std::uint64_t length = 0;
    std::uint32_t attributes = 0;
    std::string bytes = {};
  };
  std::map<Text, File> files;
  std::vector<Text> folders;
  // Folders that no listing shows, although their names are taken.
  std::vector<Text> hiddenFolders;
  std::vector<Text> made;
  // The error that creating this folder raises.
  std::map<Text, std::int32_t> makeErrors;
  // The error that reading the beginning of this file raises.
  std::map<Text, std::int32_t> readErrors;
  // Room on the disk for each written file.
  std::size_t mostWritten = SIZE_MAX;
  // Whether attributes can be changed.
  bool writable = true;
  std::vector<std::uint32_t> attributesSet;
  Text temp = u"C:\\Temp\\";

  File& At(TextView path) {
    const auto found = files.find(Text(path));
    if (found == files.end()) throw RuntimeError(error::kFileNotFound);
    return found->second;
  }
  std::uint64_t Length(TextView path) override { return At(path).length; }
  Text ModifiedText(TextView path) override {
    At(path);
    return u"1/2/2026 3:04:05 AM";
  }
  std::uint32_t Attributes(TextView path) override { return At(path).attributes; }
  void SetAttributes(TextView path, std::uint32_t attributes) override {
    if (!writable) throw RuntimeError(error::kPathAccess);
    At(path).attributes = attributes;
    attributesSet.push_back(attributes);
  }
  // Another spelling of a path; the files themselves are kept under one.
  std::map<Text, Text> spellings;
  Text Spelled(TextView path) const {
    const auto known = spellings.find(Text(path));
    return known == spellings.end() ? Text(path) : known->second;
  }
  bool SameFile(TextView first, TextView second) override {
    return files.contains(Spelled(first)) && Spelled(first) == Spelled(second);
  }
  // Like the system's: a file is not copied onto itself.
  void Copy(TextView source, TextView destination) override {
    if (SameFile(source, destination) || At(source).length > mostWritten)
      throw RuntimeError(error::kPathAccess);
    files[Text(destination)] = At(source);
  }
  struct Reader : FileReader {
    explicit Reader(std::string itsBytes) : bytes(std::move(itsBytes)) {}
    std::size_t Read(std::span<char> room) override {
      const std::size_t count = bytes.copy(room.data(), room.size(), at);
      at += count;
      return count;
    }
    const std::string bytes;
    std::size_t at = 0;
  };
  std::unique_ptr<FileReader> Open(TextView path) override {
    return std::make_unique<Reader>(At(path).bytes);
  }
  std::size_t ReadBeginning(TextView path, std::span<char> room) override {
    if (const auto failure = readErrors.find(Text(path)); failure != readErrors.end())
      throw RuntimeError(failure->second);
    return files[Text(path)].bytes.copy(room.data(), room.size());
  }
  struct Writer : FileWriter {
    Writer(FakeFiles& itsOwner, TextView itsPath) : owner(itsOwner), path(itsPath) { ++owner.writers; }
    ~Writer() override { --owner.writers; }
    void Write(std::string_view more) override {
      if (bytes.size() + more.size() > owner.mostWritten) throw RuntimeError(error::kPathAccess);
      bytes += more;
      owner.bytesWritten += more.size();
    }
    void Commit() override { owner.files[path] = {bytes.size(), 0, bytes}; }
    FakeFiles& owner;
    const Text path;
    std::string bytes;
  };
  // Files that are being written.
  int writers = 0;
  // All that was ever written.
  std::size_t bytesWritten = 0;
  std::unique_ptr<FileWriter> Create(TextView path) override { return std::make_unique<Writer>(*this, path); }
  bool WriteNew(TextView path, std::string_view bytes) override {
    if (files.contains(Spelled(path)) || bytes.size() > mostWritten) return false;
    Writer file(*this, path);
    file.Write(bytes);
    file.Commit();
    return true;
  }
  void Remove(TextView path) override {
    constexpr std::uint32_t kReadOnly = 1;
    if ((At(path).attributes & kReadOnly) != 0) throw RuntimeError(error::kPathAccess);
    files.erase(Text(path));
  }
  Text cleaned;
  void RemoveLeftovers(TextView folder) noexcept override { cleaned = folder; }
  bool Exists(TextView pattern, bool withFolders) override {
    return files.contains(Text(pattern)) || (withFolders && std::ranges::count(folders, pattern) > 0);
  }
  void MakeFolder(TextView path) override {
    if (const auto failure = makeErrors.find(Text(path)); failure != makeErrors.end())
      throw RuntimeError(failure->second);
    if (std::ranges::count(folders, path) + std::ranges::count(hiddenFolders, path) > 0)
      throw RuntimeError(error::kFileAlreadyExists);
    folders.emplace_back(path);
    made.emplace_back(path);
  }
  Text TempPath() override { return temp; }
};

struct FakeInternet : Internet {
  // "open AGENT", "connect HOST|PORT|USER|PASSWORD", "cd PATH", "pwd", "get FILE TO", commands, "close".
  std::vector<Text> calls;
  bool opens = true;
  bool connects = true;
  bool changesDirectory = true;
  bool takesCommands = true;
  std::optional<Text> directory = u"/";

  struct Connection : FtpConnection {
    explicit Connection(FakeInternet& itsOwner) : owner(itsOwner) {}
    ~Connection() override { owner.calls.emplace_back(u"close"); }
    bool SetDirectory(TextView path) override {
      owner.calls.push_back(u"cd " + Text(path));
      return owner.changesDirectory;
    }
    std::optional<Text> Directory() override {
      owner.calls.emplace_back(u"pwd");
      return owner.directory;
    }
    bool GetFile(TextView server, TextView local) override {
      owner.calls.push_back(u"get " + Text(server) + u" " + Text(local));
      return true;
    }
    bool Command(TextView command) override {
      owner.calls.emplace_back(command);
      return owner.takesCommands;
    }
    FakeInternet& owner;
  };
  struct Session : InternetSession {
    explicit Session(FakeInternet& itsOwner) : owner(itsOwner) {}
    std::unique_ptr<FtpConnection> ConnectFtp(TextView host, std::uint16_t port, TextView user,
                                              TextView password) override {
      owner.calls.push_back(u"connect " + Text(host) + u"|" + TextFromNumber(port) + u"|" + Text(user) +
                            u"|" + Text(password));
      if (!owner.connects) return nullptr;
      return std::make_unique<Connection>(owner);
    }
    FakeInternet& owner;
  };
  std::unique_ptr<InternetSession> Open(TextView agent) override {
    calls.push_back(u"open " + Text(agent));
    if (!opens) return nullptr;
    return std::make_unique<Session>(*this);
  }
};

struct FakeStrings : StringResources {
  using Strings = std::map<std::uint16_t, Text>;
  static Text Find(const Strings& strings, std::uint16_t identifier) {
    const auto found = strings.find(identifier);
    return found == strings.end() ? Text() : found->second;
  }
  struct Library : ResourceLibrary {
    explicit Library(const Strings& itsStrings) : strings(itsStrings) {}
    Text String(std::uint16_t identifier) override { return Find(strings, identifier); }
    const Strings& strings;
  };

  Strings own;
  std::map<Text, Strings> libraries;
  std::vector<Text> loads;

  std::unique_ptr<ResourceLibrary> Load(TextView path) override {
    loads.emplace_back(path);
    const auto found = libraries.find(Text(path));
    if (found == libraries.end()) return nullptr;
    return std::make_unique<Library>(found->second);
  }
  Text OwnString(std::uint16_t identifier) override { return Find(own, identifier); }
};

struct FakePump : MessagePump {
  int yields = 0;
  // What other code does while messages are handled.
  std::function<void()> onYield;
  void Yield() override {
    ++yields;
    if (onYield) onYield();
  }
  // What happens while a wait sleeps; false for a quit message. Without it there is only that.
  std::function<bool()> onWait;
  bool Wait() override { return onWait && onWait(); }
};

struct FakePlatform {
  FakeRegistry registry;
  FakeHttp http;
  FakeInternet internet;
  FakeFiles files;
  FakeStrings strings;
  FakePump pump;
  Apartment apartment{Platform{registry, http, internet, files, strings, pump}};
};

}  // namespace tarnwick
