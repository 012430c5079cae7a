// Benchmarks of the registered library, side by side with what the system offers. Prints rows of one table;
// ends with 1 when one is out of its bounds.
//
//   tarnwick_windows_bench transfer SERVER USER PASSWORD PRODUCT LARGE SMALL-COUNT
//   tarnwick_windows_bench list     SERVER USER PASSWORD PRODUCT RECORDS
//   tarnwick_windows_bench image    FOLDER
#include "Bench.h"

#include <ole2.h>

#include <cstdio>

namespace {

void Run(const std::vector<std::wstring>& words) {
  using namespace tarnwick::bench;
  const std::wstring kind = words.empty() ? L"" : words[0];
  if (kind == L"image" && words.size() == 2) return ImageBench(words[1]);
  if (words.size() < 6) Stop("KIND SERVER USER PASSWORD PRODUCT NUMBER...");
  const Account account{words[1], words[2], words[3], words[4]};
  const int first = _wtoi(words[5].c_str());
  if (kind == L"transfer" && words.size() == 7)
    return TransferBench(account, static_cast<std::size_t>(first), _wtoi(words[6].c_str()));
  if (kind == L"list" && words.size() == 6) return ListBench(account, first);
  Stop("transfer, list or image");
}

}  // namespace

int wmain(int count, wchar_t** words) {
  std::setvbuf(stdout, nullptr, _IONBF, 0);
  OleInitialize(nullptr);
  Run({words + 1, words + count});
  OleUninitialize();
  return tarnwick::bench::AllWithin() ? 0 : 1;
}
