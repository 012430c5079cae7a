// Benchmarks of the registered library, side by side with what the system offers. Prints rows for
// bench/table.py, and lines "run COMMAND", each answered on the input with the microseconds that the shell
// command took, or 0 when it failed.
//
//   tarnwick_windows_bench transfer USER PASSWORD PRODUCT SERVER LARGE SMALL-COUNT
//   tarnwick_windows_bench tls      USER PASSWORD PRODUCT SERVER SMALL-COUNT
//   tarnwick_windows_bench upload   USER PASSWORD PRODUCT SERVER
//   tarnwick_windows_bench list     USER PASSWORD PRODUCT SERVER SERVER SERVER SERVER SERVER
//   tarnwick_windows_bench page     USER PASSWORD PRODUCT SERVER
//   tarnwick_windows_bench image    FOLDER
#include "Bench.h"

#include <ole2.h>

namespace {

void Run(const std::vector<std::wstring>& words) {
  using namespace tarnwick::bench;
  const std::wstring kind = words.empty() ? L"" : words[0];
  if (kind == L"image" && words.size() == 2) return ImageBench(words[1]);
  if (words.size() < 5) Stop("KIND USER PASSWORD PRODUCT SERVER...");
  const auto account = [&](std::size_t word) { return Account{words[word], words[1], words[2], words[3]}; };
  if (kind == L"transfer" && words.size() == 7)
    return TransferBench(account(4), static_cast<std::size_t>(_wtoi(words[5].c_str())),
                         _wtoi(words[6].c_str()));
  if (kind == L"tls" && words.size() == 6) return TlsBench(account(4), _wtoi(words[5].c_str()));
  if (kind == L"upload" && words.size() == 5) return UploadBench(account(4));
  if (kind == L"list" && words.size() == 9)
    return ListBench(account(4), account(5), {account(6), account(7), account(8)});
  if (kind == L"page" && words.size() == 5) return PageBench(account(4));
  Stop("transfer, tls, upload, list, page or image");
}

}  // namespace

int wmain(int count, wchar_t** words) {
  OleInitialize(nullptr);
  Run({words + 1, words + count});
  OleUninitialize();
  return 0;
}
