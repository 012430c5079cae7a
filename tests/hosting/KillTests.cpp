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

// One client that replaces, renames and deletes a file of its own until the server is gone.
class Changer {
 public:
  explicit Changer(char letter) : letter_(letter) {}

  void Run(int port) {
    HostingClient client(port);
    for (;; sure_ = open_, ++changes_) {
      const std::string name = letter_ + std::string(".jpg");
      const std::string other = letter_ + std::string("2.jpg");
      int number = kNoNumber;
      if (changes_ % 3 == 0) {
        open_ = {{name, std::string(1 + changes_ * 7919 % 100'000, letter_)}};
        number = client.Upload(name, open_[name]);
      } else if (changes_ % 3 == 1) {
        open_ = {{other, sure_[name]}};
        number = client.Rename(name, other);
      } else {
        open_.clear();
        number = client.Delete(other);
      }
      if (number == kNoNumber) return;
    }
  }

  // What a listing shows of this client's file must be the state before or after the last change, which is
  // taken over.
  void Check(const Files& listing) {
    Files mine;
    for (const auto& file : listing)
      if (file.first[0] == letter_) mine.insert(file);
    EXPECT_TRUE(mine == sure_ || mine == open_) << letter_ << ": acknowledged changes are lost or half done";
    if (mine == open_ && open_ != sure_) ++changes_;
    sure_ = open_ = mine;
  }

  std::size_t Changes() const { return changes_; }

 private:
  const char letter_;
  // The states before and after the last change, of which it is not known which one the server has.
  Files sure_;
  Files open_;
  std::size_t changes_ = 0;
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
  for (const char letter : {'p', 'q', 'r'}) changers.emplace_back(letter);
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
  for (const Changer& changer : changers) EXPECT_GT(changer.Changes(), std::size_t{kRounds});
}

}  // namespace
}  // namespace tarnwick::hosting
