#include <pthread.h>
#include <signal.h>

#include <cstdio>
#include <exception>
#include <string>
#include <vector>

#include "hosting/Options.h"
#include "hosting/Server.h"

namespace {

namespace hosting = tarnwick::hosting;

constexpr int kFailed = 1;
constexpr int kBadOptions = 2;

void PrintLine(const std::string& line) {
  std::fputs((line + "\n").c_str(), stdout);
  std::fflush(stdout);
}

int Serve(const hosting::Options& options) {
  // Blocked before any thread starts, so that none but this one takes them.
  sigset_t ends;
  sigemptyset(&ends);
  sigaddset(&ends, SIGINT);
  sigaddset(&ends, SIGTERM);
  pthread_sigmask(SIG_BLOCK, &ends, nullptr);

  // A limit on the size of files is a full disk, not the end.
  signal(SIGXFSZ, SIG_IGN);

  hosting::Server server(options, PrintLine);
  const int port = server.Listen();
  if (options.tlsSelfSigned) PrintLine("authority: " + options.Authority().string());
  PrintLine("listening on " + hosting::ServerName(options, port));
  server.Start();
  int signal = 0;
  sigwait(&ends, &signal);
  server.Stop();
  return 0;
}

}  // namespace

int main(int count, char** arguments) {
  try {
    const hosting::Options options =
        hosting::ParseOptions(std::vector<std::string>(arguments + 1, arguments + count));
    if (!options.help.empty()) {
      std::fputs(options.help.c_str(), stdout);
      return 0;
    }
    return Serve(options);
  } catch (const hosting::OptionError& error) {
    std::fprintf(stderr, "tarnwick-hosting: %s (see --help)\n", error.what());
    return kBadOptions;
  } catch (const std::exception& error) {
    std::fprintf(stderr, "tarnwick-hosting: %s\n", error.what());
    return kFailed;
  }
}
