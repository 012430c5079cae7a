// Measures what grows with an account: the parameter cipher by the length of its text, and a listing reply
// turned into records by the number of its files. The cost of a character or a file must not grow with their
// number.
//
// Prints one table and ends with 1 when a cost grows beyond the limit. Each figure is the fastest of several
// runs, which is the one that other programs on the machine disturbed least.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <functional>
#include <limits>
#include <string>
#include <vector>

#ifdef __GLIBC__
#include <malloc.h>
#endif

#include "fakes/FakePlatform.h"
#include "service/CFileUpload.h"
#include "service/modEnctyption.h"
#include "session/Apartment.h"

namespace tarnwick {
namespace {

constexpr double kLimit = 1.20;
constexpr int kRuns = 15;

// --- What is measured ---

// Processor seconds that `work` takes. It waits for nothing, and other programs' turns do not count.
double Seconds(const std::function<void()>& work) {
  const std::clock_t begin = std::clock();
  work();
  return static_cast<double>(std::clock() - begin) / CLOCKS_PER_SEC;
}

[[noreturn]] void Stop(const char* what) {
  std::fprintf(stderr, "bench: %s\n", what);
  std::exit(2);
}

// Seconds of enciphering a text of that length once.
double CipherRun(std::size_t length) {
  constexpr TextView kUnits = u"The quick brown fox jumps over 13 lazy dogs/";
  Text text;
  for (std::size_t i = 0; i < length; ++i) text.push_back(kUnits[i % kUnits.size()]);
  // Short texts are repeated, so that the clock's grain does not count.
  const std::size_t repeats = 1 + 1'000'000 / std::max<std::size_t>(1, length);
  std::size_t kept = 0;
  const double seconds = Seconds([&] {
    for (std::size_t i = 0; i < repeats; ++i) kept += EncryptParameter(text).size();
  });
  if (kept == 0) Stop("the cipher returned nothing");
  return seconds / static_cast<double>(repeats);
}

std::string ListingReply(std::size_t files) {
  std::string body;
  body.reserve(files * 220);
  const auto add = [&](const char* format) {
    char value[128];
    for (std::size_t i = 0; i < files; ++i) {
      if (!body.empty()) body += '&';
      body.append(value, static_cast<std::size_t>(std::snprintf(value, sizeof value, format, i)));
    }
  };
  add("FileName=holiday%%20picture%%20%06zu.jpg");
  add("FileURL=http%%3A%%2F%%2F127.0.0.1%%3A8080%%2Fusers%%2Fsomebody%%40mail-example%%2Fholiday%%20picture%%"
      "20%06zu.jpg");
  add("FileSize=%zu");
  add("FileDate=11%%2F25%%2F2026%%2010%%3A04%%3A%02zu%%20AM");
  return body;
}

// Seconds from the reply's bytes to records in a list with keys.
double ListingRun(const std::string& reply, std::size_t files) {
  FakePlatform platform;
  platform.apartment.session.serverName = u"127.0.0.1";
  platform.http.answers.push_back(HttpAnswer{200, reply});
  Apartment& apartment = platform.apartment;
  CFileUpload client(apartment);
#ifdef __GLIBC__
  // Fresh memory, as for the first listing of a host; else the heap that the run before left is measured too.
  malloc_trim(0);
#endif
  bool listed = false;
  const double seconds = Seconds([&] {
    listed = client.ListFilesForUser(
        [&](const std::shared_ptr<CUpload>& file) { apartment.listing.all.Add(file); });
  });
  if (!listed || apartment.listing.all.Count() != files) Stop("the listing is not complete");
  return seconds;
}

// --- The table ---

struct Row {
  const char* what;
  std::size_t count;
  // Bytes on the wire.
  std::size_t bytes;
  std::function<double()> run;
  double seconds = std::numeric_limits<double>::infinity();
};

// Measures the rows, which differ in their count alone, and prints them. The first one is what the others are
// compared with. True when none is over the limit.
bool Measure(std::vector<Row> rows) {
  // In turn, so that a busy moment of the machine does not meet one count alone.
  for (int run = 0; run < kRuns; ++run)
    for (Row& row : rows) row.seconds = std::min(row.seconds, row.run());

  bool flat = true;
  const double base = rows.front().seconds / static_cast<double>(rows.front().count);
  for (const Row& row : rows) {
    const double each = row.seconds / static_cast<double>(row.count);
    std::printf("%-22s %9zu %12.3f %10.2f %9.1f", row.what, row.count, row.seconds * 1e3, each * 1e9,
                static_cast<double>(row.bytes) / row.seconds / 1e6);
    if (&row == &rows.front()) {
      std::printf("\n");
      continue;
    }
    const double ratio = each / base;
    std::printf(" %7.2f %7.2f  %s\n", ratio, kLimit, ratio <= kLimit ? "flat" : "GROWS");
    flat = flat && ratio <= kLimit;
  }
  return flat;
}

int Run() {
  std::printf("%-22s %9s %12s %10s %9s %7s %7s  %s\n", "what", "count", "ms", "ns each", "MB/s", "ratio",
              "limit", "verdict");
  std::vector<Row> rows;
  for (const std::size_t length : {1'000U, 10'000U, 100'000U, 1'000'000U})
    rows.push_back({"cipher, characters", length, length, [length] { return CipherRun(length); }});
  bool flat = Measure(std::move(rows));

  rows.clear();
  for (const std::size_t files : {10'000U, 100'000U}) {
    std::string reply = ListingReply(files);
    const std::size_t bytes = reply.size();
    rows.push_back({"listing reply, files", files, bytes,
                    [reply = std::move(reply), files] { return ListingRun(reply, files); }});
  }
  flat = Measure(std::move(rows)) && flat;
  return flat ? 0 : 1;
}

}  // namespace
}  // namespace tarnwick

int main() {
  return tarnwick::Run();
}
