// What the benchmarks under Wine share: commands of the machine itself, windows, and the account.
#pragma once

#include "platform/windows/ComPtr.h"
#include "platform/windows/WindowsHeaders.h"
#include "surface/TypeLibrary.h"

#include <oleauto.h>

#include <array>
#include <string>

#include "ControlContainer.h"
#include "Rounds.h"

namespace tarnwick::bench {

// Has the script run a shell command of the machine itself, in the folder of the benchmark, and returns the
// seconds that it took there.
double Native(const std::string& command);
// What such a command calls the file.
std::string NativePath(const std::wstring& path);

// Processor seconds of this program up to now, in ticks of 10 ms under Wine.
double ProcessorSeconds();

// Handles what is in the thread's message queue; what is to be painted is part of that.
void Pump();

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
  std::wstring server;  // host:port, or the same behind https://
  std::wstring user;
  std::wstring password;
  std::wstring product;
};

// Connects and logs on, after which the library knows no listing. Returns the address of the account's
// folder, with its slash.
std::wstring LogOn(_CFileUpload& client, const Account& account);

// Logs the list's client on and shows its listing to the list.
std::wstring ShowAccount(_ctrlListImage& list, const Account& account);

// Where the library keeps the copies of the account whose folder has that address.
std::wstring UserFolder(std::wstring url);

// A window on the display with one control that fills it.
class Form {
 public:
  Form(const CLSID& control, SIZE size);
  ~Form();
  Form(const Form&) = delete;
  Form& operator=(const Form&) = delete;
  HWND Window() const { return window_; }
  template <class Interface>
  ComPtr<Interface> Control() const {
    ComPtr<Interface> control;
    container_->Control()->QueryInterface(__uuidof(Interface), control.ReceiveVoid());
    return control;
  }

 private:
  HWND window_;
  ComPtr<demo::ControlContainer> container_;
};

// Each prints its rows.
void TransferBench(const Account& account, std::size_t largeBytes, int smallCount);
// The same account over TLS.
void TlsBench(const Account& account, int smallCount);
void UploadBench(const Account& account);
// Accounts with 500 and with 100,000 files, and with 2,000, 20,000 and 100,000 on servers that only repeat
// what another one answered.
void ListBench(const Account& shown, const Account& all, const std::array<Account, 3>& replays);
void PageBench(const Account& account);
void ImageBench(const std::wstring& folder);

}  // namespace tarnwick::bench
