// Measures what grows with an account: the parameter cipher by the length of its text, and a listing reply
// turned into records by the number of its files and the length of their names.
#include <algorithm>
#include <cstdio>
#include <ctime>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <unordered_map>
#include <vector>

#ifdef __GLIBC__
#include <malloc.h>
#endif

#include "Rounds.h"
#include "fakes/FakePlatform.h"
#include "service/CFileUpload.h"
#include "service/modEnctyption.h"
#include "session/Apartment.h"

namespace tarnwick::bench {
namespace {

// Processor seconds that `work` takes. It waits for nothing, and other programs' turns do not count.
double ProcessorSeconds(const std::function<void()>& work) {
  const std::clock_t begin = std::clock();
  work();
  return static_cast<double>(std::clock() - begin) / CLOCKS_PER_SEC;
}

// Seconds of enciphering a text of that length once.
double CipherRun(std::size_t length) {
  constexpr TextView kUnits = u"The quick brown fox jumps over 13 lazy dogs/";
  Text text;
  for (std::size_t i = 0; i < length; ++i) text.push_back(kUnits[i % kUnits.size()]);
  // Short texts are repeated, so that the clock's grain does not count.
  const std::size_t repeats = 1 + 1'000'000 / std::max<std::size_t>(1, length);
  std::size_t kept = 0;
  const double seconds = ProcessorSeconds([&] {
    for (std::size_t i = 0; i < repeats; ++i) kept += EncryptParameter(text).size();
  });
  if (kept == 0) Stop("the cipher returned nothing");
  return seconds / static_cast<double>(repeats);
}

// A reply with files whose names have that many characters, 12 at least.
std::string ListingReply(std::size_t files, std::size_t nameLength) {
  const std::string stem = std::string(nameLength - 10, 'n') + "%20";
  std::string body;
  const auto add = [&](const std::string& name, const char* format) {
    char value[64];
    for (std::size_t i = 0; i < files; ++i) {
      if (!body.empty()) body += '&';
      body.append(name);
      body.append(value, static_cast<std::size_t>(std::snprintf(value, sizeof value, format, i)));
    }
  };
  add("FileName=" + stem, "%05zu.jpg");
  add("FileURL=http%3A%2F%2F127.0.0.1%3A8080%2Fusers%2Fsomebody%40mail-example%2F" + stem, "%05zu.jpg");
  add("FileSize=", "%zu");
  add("FileDate=11%2F25%2F2026%2010%3A04%3A", "%02zu%%20AM");
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
  const double seconds = ProcessorSeconds([&] {
    listed = client.ListFilesForUser(
        [&](const std::shared_ptr<CUpload>& file) { apartment.listing.all.Add(file); });
  });
  if (!listed || apartment.listing.all.Count() != files) Stop("the listing is not complete");
  return seconds;
}

// --- The peer ---

// The value that begins at `from` and ends with '&', where `from` is then, or with the reply.
Text PlainValue(const std::string& reply, std::size_t& from) {
  std::string bytes;
  for (; from < reply.size() && reply[from] != '&'; ++from) {
    const bool escape = reply[from] == '%';
    bytes += escape ? static_cast<char>(std::stoi(reply.substr(from + 1, 2), nullptr, 16)) : reply[from];
    if (escape) from += 2;
  }
  return TextFromWtf8(bytes);
}

// Of plain digits.
double PlainNumber(const Text& digits) {
  double number = 0;
  for (const char16_t digit : digits) number = number * 10 + (digit - u'0');
  return number;
}

// The same as in a first version: texts of their own in the standard containers.
double PlainListingRun(const std::string& reply, std::size_t files) {
  struct Record {
    Text name, address, date;
    double size = 0;
  };
  std::vector<std::shared_ptr<Record>> records;
  std::unordered_map<Text, Record*> byAddress;
#ifdef __GLIBC__
  malloc_trim(0);
#endif
  const double seconds = ProcessorSeconds([&] {
    std::map<std::string, std::vector<Text>> values;
    for (std::size_t from = 0; from < reply.size(); ++from) {
      const std::size_t equals = reply.find('=', from);
      const std::string name = reply.substr(from, equals - from);
      from = equals + 1;
      values[name].push_back(PlainValue(reply, from));
    }
    for (std::size_t i = 0; i < values["FileName"].size(); ++i) {
      records.push_back(
          std::make_shared<Record>(Record{values["FileName"][i], values["FileURL"][i], values["FileDate"][i],
                                          PlainNumber(values["FileSize"][i])}));
      byAddress.emplace(records.back()->address, records.back().get());
    }
  });
  if (byAddress.size() != files) Stop("the plain listing is not complete");
  return seconds;
}

Side Listing(const char* name, std::size_t files, std::size_t nameLength, std::size_t units) {
  return {name, [files, reply = ListingReply(files, nameLength)] { return ListingRun(reply, files); },
          static_cast<double>(units)};
}

void Run() {
  const auto cipher = [](const char* name, std::size_t length) {
    return Side{name, [length] { return CipherRun(length); }, static_cast<double>(length)};
  };
  std::vector<Side> ciphers = {cipher("library", 1'000'000), cipher("itself, of 1,000", 1'000)};
  Measure(ciphers);
  Row("cipher, a character of 1,000,000", ciphers[0], ciphers[1], "<=1.2", "memory for a longer text");

  // Bytes of a file's part of the reply, to tell what a byte costs.
  const auto bytes = [](std::size_t nameLength) { return ListingReply(1'000, nameLength).size() / 1'000; };
  constexpr std::size_t kMany = 100'000;
  constexpr std::size_t kFew = 10'000;
  std::vector<Side> listings = {
      Listing("library", kMany, 25, kMany),
      Listing("itself, of 10,000", kFew, 25, kFew),
      Listing("library", kFew, 200, kFew * bytes(200)),
      Listing("itself, names of 12", kFew, 12, kFew * bytes(12)),
      {"standard containers", [reply = ListingReply(kMany, 25)] { return PlainListingRun(reply, kMany); },
       kMany}};
  Measure(listings);
  Row("listing reply, a file of 100,000", listings[0], "s", "<=600e-9",
      "unescaping, memory for a record, its key in the index");
  // The time follows the machine, which takes twice as long at one time as at another; this does not.
  Row("listing reply, a file of 100,000", listings[0], listings[4], ">=4.0",
      "the peer copies and widens every text; here unescaping is a sixth of all samples, fresh memory a "
      "fifth, "
      "the index a fifth");
  Row("listing reply, a file of 100,000", listings[0], listings[1], "<=1.2",
      "an index that outgrows the processor's cache");
  Row("listing reply, a byte, names of 200", listings[2], listings[3], "<=1.2",
      "none: a longer name spreads a record's fixed cost");
}

}  // namespace
}  // namespace tarnwick::bench

int main() {
  tarnwick::bench::Run();
}
