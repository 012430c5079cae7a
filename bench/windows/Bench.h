// What the benchmarks under Wine share: measuring, one row of the table each, and the account.
#pragma once

#include "platform/windows/ComPtr.h"
#include "platform/windows/WindowsHeaders.h"
#include "surface/TypeLibrary.h"

#include <oleauto.h>

#include <functional>
#include <string>
#include <vector>

namespace tarnwick::bench {

// Ends the program with 2.
[[noreturn]] void Stop(const char* what);

// By the clock on the wall.
double Seconds(const std::function<void()>& work);

// The fastest of several runs of each; they take turns, so that a busy moment hits all alike. `before` runs
// before each, and its time does not count.
std::vector<double> Fastest(
    int runs, const std::vector<std::function<void()>>& works, const std::function<void()>& before = [] {});

// Prints a row and remembers whether it is within its limit.
// `peer` took `theirs` seconds; the library, which took `ours`, is to be at least `least` times as fast.
void AtLeast(double least, const char* what, double ours, const char* peer, double theirs);
// The library is to take at most `most` times the peer's time.
void AtMost(double most, const char* what, double ours, const char* peer, double theirs);
// A figure of its own kind.
void AtMost(double most, const char* what, double figure, const char* unit);
// A peer that is only shown.
void Beside(const char* what, double ours, const char* peer, double theirs);
// Whether all rows so far are within their limits.
bool AllWithin();

class Bstr {
 public:
  explicit Bstr(const std::wstring& text)
      : text_(SysAllocStringLen(text.data(), static_cast<UINT>(text.size()))) {}
  ~Bstr() { SysFreeString(text_); }
  Bstr(const Bstr&) = delete;
  Bstr& operator=(const Bstr&) = delete;
  operator BSTR() const { return text_; }  // NOLINT(google-explicit-constructor)
  BSTR* Reference() { return &text_; }

 private:
  BSTR text_;
};

struct Account {
  std::wstring server;  // host:port
  std::wstring user;
  std::wstring password;
  std::wstring product;
};

// Logs the list on and shows its listing to it. Returns the address of the account's folder, with its slash.
std::wstring LogOn(_ctrlListImage& list, const Account& account);

// Each prints its rows.
void TransferBench(const Account& account, std::size_t largeBytes, int smallCount);
void ListBench(const Account& account, int records);
void ImageBench(const std::wstring& folder);

}  // namespace tarnwick::bench
