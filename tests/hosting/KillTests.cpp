// The real program: its start, its end, and what it keeps when it is killed at any moment.
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <random>
#include <thread>

#include "HostingFixture.h"
#include "hosting/Database.h"

namespace tarnwick::hosting {
namespace {

using Files = std::map<std::string, std::string>;

class Program {
 public:
  explicit Program(std::vector<std::string> arguments) {
    int ends[2];
    if (pipe2(ends, O_CLOEXEC) != 0) return;
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
    arguments.insert(arguments.begin(), HOSTING_PROGRAM);
    std::vector<char*> pointers;
    pointers.reserve(arguments.size() + 1);
    for (std::string& argument : arguments) pointers.push_back(argument.data());
    pointers.push_back(nullptr);
    posix_spawn(&process_, HOSTING_PROGRAM, &actions, nullptr, pointers.data(), environ);
    posix_spawn_file_actions_destroy(&actions);
    close(ends[1]);
    output_ = fdopen(ends[0], "r");
  }
  Program(const Program&) = delete;
  Program& operator=(const Program&) = delete;
  ~Program() {
    if (process_ > 0) End(SIGKILL);
    if (output_) fclose(output_);
  }

  std::string ReadLine() {
    std::string line;
    for (int byte; (byte = std::fgetc(output_)) != EOF && byte != '\n';) line += static_cast<char>(byte);
    return line;
  }

  // The port that the first line tells; 0 when there is none.
  int ReadPort() {
    const std::string line = ReadLine();
    int port = 0;
    return std::sscanf(line.c_str(), "listening on 127.0.0.1:%d", &port) == 1 ? port : 0;
  }

  // Exit code, or minus the signal that ended it.
  int End(int signal) {
    if (signal != 0) kill(process_, signal);
    int status = 0;
    waitpid(process_, &status, 0);
    process_ = 0;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
  }

 private:
  pid_t process_ = 0;
  FILE* output_ = nullptr;
};

TEST(ProgramTest, StartsSeedsPrintsAndEnds) {
  TemporaryFolder folder;
  const std::string data = folder.Path() / "data";
  std::filesystem::create_directory(folder.Path() / "pictures");
  WriteFile(folder.Path() / "pictures" / "one.jpg", "111");
  WriteFile(folder.Path() / "pictures" / "two b.gif", "22");
  const std::vector<std::string> arguments = {
      "--data",          data,      "--seed-user",     kUser,
      "--seed-password", kPassword, "--seed-pictures", folder.Path() / "pictures"};
  for (const int signal : {SIGTERM, SIGINT}) {
    Program program(arguments);
    const int port = program.ReadPort();
    ASSERT_NE(port, 0);
    HostingClient client(port);
    EXPECT_EQ(client.CheckedListing().size(), 2U);
    EXPECT_EQ(client.Upload("one.jpg", "changed"),
              signal == SIGTERM ? kStored : kNothingChanged);  // seeded once only
    // A line follows its answer, so the next request's may come first.
    bool isPrinted = false;
    for (int i = 0; i < 3 && !isPrinted; ++i)
      isPrinted = program.ReadLine().starts_with("POST /bv/bin/BVServicePage.asp ListFiles user=" +
                                                 std::string(kUser) + " status=200 result=2-files in=");
    EXPECT_TRUE(isPrinted);
    // A second server on the same data gives up, one on the same port too.
    EXPECT_EQ(Program({"--data", data}).End(0), 1);
    EXPECT_EQ(Program({"--data", data + "2", "--port", std::to_string(port)}).End(0), 1);
    EXPECT_EQ(program.End(signal), 0);
  }
  EXPECT_EQ(Program({"--help"}).End(0), 0);
  EXPECT_EQ(Program({"--port", "1"}).End(0), 2);
}

// One client that changes its own files until the server is gone. It keeps what was acknowledged, and the one
// change whose answer did not come.
class Changer {
 public:
  Changer(char letter, unsigned seed) : letter_(letter), random_(seed) {}

  void Run(int port) {
    HostingClient client(port);
    while (Step(client)) {
    }
  }

  // Takes over what a listing shows of this client's files; it must be the state before or after the last
  // change.
  void Check(const Files& listing) {
    Files mine;
    for (const auto& [name, bytes] : listing)
      if (name[0] == letter_) mine.emplace(name, bytes);
    EXPECT_TRUE(mine == sure_ || mine == open_) << letter_ << ": acknowledged changes are lost or half done";
    sure_ = open_ = mine;
  }

  int Changes() const { return changes_; }

 private:
  bool Step(HostingClient& client) {
    const std::string name = letter_ + std::to_string(random_() % 4);
    const std::string other = letter_ + std::to_string(random_() % 4);
    open_ = sure_;
    int number = kNoNumber;
    switch (random_() % 4) {
      case 0:
        open_.erase(name);
        number = client.Delete(name);
        break;
      case 1:
        if (const auto file = sure_.find(name); file != sure_.end() && !sure_.contains(other)) {
          open_[other] = file->second;
          open_.erase(name);
        }
        number = client.Rename(name, other);
        break;
      default:
        open_[name] = std::string(1 + random_() % 100'000, static_cast<char>('a' + random_() % 26));
        number = client.Upload(name, open_[name]);
    }
    if (number == kNoNumber) return false;
    if (number == kStored) sure_ = open_;
    open_ = sure_;
    ++changes_;
    return true;
  }

  char letter_;
  std::minstd_rand random_;
  Files sure_;
  Files open_;
  int changes_ = 0;
};

using RecoveryTest = HostingTest;

TEST_F(RecoveryTest, WhatKillsLeaveIsSweptOrTakenOver) {
  ASSERT_EQ(Client().Upload("a.jpg", "1"), kStored);
  ASSERT_EQ(Client().Upload("b.jpg", "2"), kStored);
  ASSERT_EQ(Client().Delete("b.jpg"), kStored);
  End();
  WriteFile(Data() / "work" / "1", "half a file");
  std::filesystem::create_directory(Data() / "work" / "2");
  WriteFile(Data() / "work" / "2" / "c.jpg", "of a folder on its way out");
  // A seeded folder whose account is still to be written.
  Execute(*std::make_unique<Database>(Data() / "hosting.sqlite"), "DELETE FROM accounts");
  Begin();
  EXPECT_TRUE(std::filesystem::is_empty(Data() / "work"));
  EXPECT_EQ(Client().CheckedListing(), (Files{{"a.jpg", "1"}}));
}

TEST(ProgramTest, NoAcknowledgedChangeIsLostWhenItIsKilled) {
  constexpr int kRounds = 25;
  TemporaryFolder folder;
  std::minstd_rand random(7);
  std::vector<Changer> changers;
  for (unsigned i = 0; i < 3; ++i) changers.emplace_back(static_cast<char>('p' + i), i + 1);
  const std::vector<std::string> arguments = {"--data", folder.Path() / "data", "--seed-user",
                                              kUser,    "--seed-password",      kPassword};
  for (int round = 0; round <= kRounds; ++round) {
    Program program(arguments);
    const int port = program.ReadPort();
    ASSERT_NE(port, 0);
    EXPECT_TRUE(std::filesystem::is_empty(folder.Path() / "data" / "work"));
    const Files listing = HostingClient(port).CheckedListing();
    for (Changer& changer : changers) changer.Check(listing);
    if (round == kRounds) break;
    std::vector<std::thread> threads;
    threads.reserve(changers.size());
    for (Changer& changer : changers) threads.emplace_back([&changer, port] { changer.Run(port); });
    // Nobody reads the program's lines, so the time must not let them fill the pipe.
    std::this_thread::sleep_for(std::chrono::milliseconds(20 + random() % 150));
    EXPECT_EQ(program.End(SIGKILL), -SIGKILL);
    for (std::thread& thread : threads) thread.join();
  }
  int changes = 0;
  for (const Changer& changer : changers) changes += changer.Changes();
  EXPECT_GT(changes, kRounds * 5);
}

}  // namespace
}  // namespace tarnwick::hosting
