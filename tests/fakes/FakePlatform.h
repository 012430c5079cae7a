// Scripted doubles behind the platform seam. They record what they were asked, in order.
#pragma once

#include <cstring>
#include <deque>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "platform/FileSystem.h"
#include "platform/HttpTransport.h"
#include "platform/Internet.h"
#include "platform/Platform.h"
#include "platform/Registry.h"
#include "platform/StringResources.h"
#include "support/Apartment.h"
#include "support/RuntimeError.h"

namespace tarnwick {

// Answers posts with the queued bodies; a post without one is a failed connection.
struct FakeHttp : HttpTransport {
  struct Sent {
    Text host;
    std::uint16_t port;
    std::string target;
    std::string body;
  };
  std::deque<HttpAnswer> answers;
  std::vector<Sent> sent;

  std::optional<HttpAnswer> Post(const HttpPost& post, std::size_t) override {
    sent.push_back({post.host, post.port, post.target, std::string(post.body)});
    if (answers.empty()) return std::nullopt;
    HttpAnswer answer = answers.front();
    answers.pop_front();
    return answer;
  }
};

struct FakeRegistry : Registry {
  struct Value {
    std::uint32_t type;
    std::string bytes;
  };
  using Values = std::map<Text, Value>;
  std::map<Text, Values> keys;

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
    const auto found = keys.find(Text(path));
    if (hive != kHiveCurrentUser || found == keys.end()) return 2;
    key = std::make_unique<Key>(found->second);
    return 0;
  }
  Text TextFromAnsi(std::string_view bytes) const override { return TextFromLatin1(bytes); }
};

struct FakeFiles : FileSystem {
  struct File {
    std::uint64_t length = 0;
    std::uint32_t attributes = 0;
  };
  std::map<Text, File> files;
  std::vector<Text> folders;
  std::vector<std::uint32_t> attributesSet;

  File& At(TextView path) {
    const auto found = files.find(Text(path));
    if (found == files.end()) throw RuntimeError(error::kFileNotFound);
    return found->second;
  }
  std::uint64_t Length(TextView path) override { return At(path).length; }
  Text ModifiedText(TextView) override { return u"1/2/2026 3:04:05 AM"; }
  std::uint32_t Attributes(TextView path) override { return At(path).attributes; }
  void SetAttributes(TextView path, std::uint32_t attributes) override {
    At(path).attributes = attributes;
    attributesSet.push_back(attributes);
  }
  void Copy(TextView source, TextView destination) override { files[Text(destination)] = At(source); }
  Text FirstName(TextView, bool) override { return {}; }
  void MakeFolder(TextView path) override {
    for (const Text& folder : folders)
      if (folder == path) throw RuntimeError(error::kFileAlreadyExists);
    folders.emplace_back(path);
  }
  Text TempPath() override { return u"C:\\Temp\\"; }
};

struct FakeInternet : Internet {
  std::vector<Text> calls;
  bool connects = true;

  struct Connection : FtpConnection {
    explicit Connection(FakeInternet& itsOwner) : owner(itsOwner) {}
    ~Connection() override { owner.calls.emplace_back(u"close"); }
    bool SetDirectory(TextView path) override {
      owner.calls.push_back(u"cd " + Text(path));
      return true;
    }
    std::optional<Text> Directory() override { return Text(u"/"); }
    bool GetFile(TextView server, TextView local) override {
      owner.calls.push_back(u"get " + Text(server) + u" " + Text(local));
      return true;
    }
    bool Command(TextView command) override {
      owner.calls.emplace_back(command);
      return true;
    }
    FakeInternet& owner;
  };
  struct Session : InternetSession {
    explicit Session(FakeInternet& itsOwner) : owner(itsOwner) {}
    std::unique_ptr<FtpConnection> ConnectFtp(TextView host, std::uint16_t port, TextView user,
                                              TextView password) override {
      owner.calls.push_back(Text(host) + u"|" + TextFromNumber(port) + u"|" + Text(user) + u"|" + Text(password));
      if (!owner.connects) return nullptr;
      return std::make_unique<Connection>(owner);
    }
    FakeInternet& owner;
  };
  std::unique_ptr<InternetSession> Open(TextView) override { return std::make_unique<Session>(*this); }
};

struct FakeStrings : StringResources {
  std::unique_ptr<ResourceLibrary> Load(TextView) override { return nullptr; }
  Text OwnString(std::uint16_t identifier) override { return identifier == 487 ? Text(u"own") : Text(); }
};

struct FakePump : MessagePump {
  void Yield() override {}
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
