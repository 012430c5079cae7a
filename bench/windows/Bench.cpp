#include "Bench.h"

#include <algorithm>
#include <cstdio>

namespace tarnwick::bench {
namespace {

bool allWithin = true;

void Row(const char* what, double ours, const char* peer, double theirs, double ratio) {
  std::printf("%-34s %9.1f ms  %-22s %9.1f ms  %7.2f", what, ours * 1000, peer, theirs * 1000, ratio);
}

void Limit(const char* side, double limit, bool within) {
  allWithin = allWithin && within;
  std::printf("  %s %5.2f  %s\n", side, limit, within ? "good" : "OUT OF BOUNDS");
}

}  // namespace

void Stop(const char* what) {
  std::fprintf(stderr, "bench: %s\n", what);
  ExitProcess(2);
}

double Seconds(const std::function<void()>& work) {
  LARGE_INTEGER frequency = {};
  LARGE_INTEGER begin = {};
  LARGE_INTEGER end = {};
  QueryPerformanceFrequency(&frequency);
  QueryPerformanceCounter(&begin);
  work();
  QueryPerformanceCounter(&end);
  return static_cast<double>(end.QuadPart - begin.QuadPart) / static_cast<double>(frequency.QuadPart);
}

std::vector<double> Fastest(int runs, const std::vector<std::function<void()>>& works,
                            const std::function<void()>& before) {
  std::vector<double> best(works.size(), 1e9);
  for (int run = 0; run < runs; ++run)
    for (std::size_t i = 0; i < works.size(); ++i) {
      before();
      best[i] = std::min(best[i], Seconds(works[i]));
    }
  return best;
}

void AtLeast(double least, const char* what, double ours, const char* peer, double theirs) {
  const double ratio = theirs / ours;
  Row(what, ours, peer, theirs, ratio);
  Limit("at least", least, ratio >= least);
}

void AtMost(double most, const char* what, double ours, const char* peer, double theirs) {
  const double ratio = ours / theirs;
  Row(what, ours, peer, theirs, ratio);
  Limit("at most ", most, ratio <= most);
}

void AtMost(double most, const char* what, double figure, const char* unit) {
  std::printf("%-34s %9.2f %-57s", what, figure, unit);
  Limit("at most ", most, figure <= most);
}

void Beside(const char* what, double ours, const char* peer, double theirs) {
  Row(what, ours, peer, theirs, theirs / ours);
  std::printf("\n");
}

bool AllWithin() {
  return allWithin;
}

std::wstring LogOn(_ctrlListImage& list, const Account& account) {
  ComPtr<_CFileUpload> client;
  list.get_mobjFileupload(client.Receive());
  VARIANT_BOOL done = VARIANT_FALSE;
  client->ConnectToServer(Bstr(account.server), &done);
  client->LogonAs(Bstr(account.product), Bstr(account.user), Bstr(account.password), Bstr(L""), &done);
  Bstr all(L"*");
  if (!done || FAILED(list.Init(all.Reference(), &done)) || !done) Stop("no account");
  BSTR base = nullptr;
  client->GetUserBasePath(&base);
  std::wstring folder = std::wstring(base) + L"/";
  SysFreeString(base);
  return folder;
}

}  // namespace tarnwick::bench
