// Downloads of the list control beside a plain loop over WinINet, with and without the copy that the library
// leaves in the user's folder, curl and cp, and URLDownloadToFile.
//
// The account holds "large.jpg" of LARGE bytes, "part.jpg" of an eighth of that, SMALL-COUNT files
// "small-N.jpg", and "stall.jpg", for which the server sends nothing.
#include "Bench.h"

#include <urlmon.h>
#include <wininet.h>

#include <cstdio>
#include <fstream>

namespace tarnwick::bench {
namespace {

// --- The peers ---

// The plain loop: read a block, write a block.
void WinInetDownload(const std::wstring& url, const wchar_t* path) {
  const HINTERNET session = InternetOpenW(L"bench", INTERNET_OPEN_TYPE_DIRECT, nullptr, nullptr, 0);
  const HINTERNET request = InternetOpenUrlW(session, url.c_str(), nullptr, 0,
                                             INTERNET_FLAG_RELOAD | INTERNET_FLAG_NO_CACHE_WRITE, 0);
  const HANDLE file = CreateFileW(path, GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr);
  std::vector<char> block(64 * 1024);
  DWORD count = 0;
  while (InternetReadFile(request, block.data(), static_cast<DWORD>(block.size()), &count) && count > 0) {
    DWORD written = 0;
    WriteFile(file, block.data(), count, &written, nullptr);
  }
  CloseHandle(file);
  InternetCloseHandle(request);
  InternetCloseHandle(session);
}

// --- What Wine's counters do not tell ---

// A file of this process's that Linux keeps. Its number comes from the script, as Wine has numbers of its
// own.
std::wstring ProcessFile(const wchar_t* name) {
  wchar_t number[16] = {};
  if (GetEnvironmentVariableW(L"TARNWICK_UNIX_PROCESS", number, 16) == 0) Stop("no TARNWICK_UNIX_PROCESS");
  return std::wstring(L"Z:\\proc\\") + number + L"\\" + name;
}

// Bytes of a line of the process's status, such as "VmRSS:".
double StatusBytes(const std::string& wanted) {
  std::ifstream status(ProcessFile(L"status").c_str());
  for (std::string line; std::getline(status, line);)
    if (line.starts_with(wanted)) return std::stod(line.substr(wanted.size())) * 1024;
  Stop("the process has no status");
}

// Most bytes that `work` had in memory beyond those that were there before.
double PeakBytes(const std::function<void()>& work) {
  const double before = StatusBytes("VmRSS:");
  // The peak begins anew.
  std::ofstream(ProcessFile(L"clear_refs").c_str()) << "5";
  work();
  return StatusBytes("VmHWM:") - before;
}

// --- The library ---

ComPtr<_ctrlListImage> hidden;
// Where the library keeps copies, as the machine calls it.
std::string userFolder;

void Select(_ctrlListImage& list, const std::wstring& name) {
  Bstr text(name);
  VARIANT ignored = {};
  list.UploadedFileSetFocus(text.Reference(), &ignored);
}

void Download(_ctrlListImage& list, const std::wstring& name, const wchar_t* folder) {
  Select(list, name);
  BSTR local = nullptr;
  list.DownLoadFileFromServer(Bstr(folder), &local);
  if (SysStringLen(local) == 0) Stop("a download failed");
  SysFreeString(local);
}

void CALLBACK LoseConnection(HWND, UINT, UINT_PTR timer, DWORD) {
  KillTimer(nullptr, timer);
  hidden->put_gbConnectionFailed(VARIANT_TRUE);
}

// Processor seconds of a download for which nothing comes in 10 seconds.
double Stall() {
  Select(*hidden, L"stall.jpg");
  SetTimer(nullptr, 0, 10'000, LoseConnection);
  const double before = ProcessorSeconds();
  BSTR local = nullptr;
  const double seconds = Seconds([&] { hidden->DownLoadFileFromServer(Bstr(L"library"), &local); });
  SysFreeString(local);
  if (seconds < 9.5) Stop("the stalled download ended early");
  return ProcessorSeconds() - before;
}

// --- The rows ---

// What each side does with the files of these names. All begin without a file that they will write.
struct Downloads {
  std::wstring url;
  std::vector<std::wstring> names;

  double ByLibrary(_ctrlListImage& list, const wchar_t* folder) const {
    Native("find " + Narrow(folder) + " '" + userFolder + "' -name '[lps]*.jpg' -delete");
    return Each(folder, [&](const std::wstring& name, const std::wstring&) { Download(list, name, folder); });
  }
  double ByLoop(const std::wstring& folder, bool copied) const {
    Native("find " + Narrow(folder) + " copies -name '[lps]*.jpg' -delete");
    return Each(folder, [&](const std::wstring& name, const std::wstring& target) {
      WinInetDownload(url + name, target.c_str());
      if (copied) CopyFileW(target.c_str(), (L"copies\\" + name).c_str(), FALSE);
    });
  }
  double ByUrlmon() const {
    return Each(L"urlmon", [&](const std::wstring& name, const std::wstring& target) {
      DeleteUrlCacheEntryW((url + name).c_str());
      URLDownloadToFileW(nullptr, (url + name).c_str(), target.c_str(), 0, nullptr);
    });
  }
  double ByCurl() const {
    Native("rm -rf curl curl-copies; mkdir curl");
    std::string addresses;
    for (const std::wstring& name : names)
      addresses += "url=" + Narrow(url + name) + "\noutput=curl/" + Narrow(name) + "\n";
    std::ofstream("addresses", std::ios::binary) << addresses;
    return Native("curl -sf -K addresses && cp -r curl curl-copies");
  }

 private:
  // Seconds of `work` with each name and its path in the folder, where the last file is afterwards.
  double Each(const std::wstring& folder,
              const std::function<void(const std::wstring&, const std::wstring&)>& work) const {
    const double seconds = Seconds([&] {
      std::wstring path = folder + L"\\";
      const std::size_t length = path.size();
      for (const std::wstring& name : names) work(name, path.replace(length, path.npos, name));
    });
    if (GetFileAttributesW((folder + L"\\" + names.back()).c_str()) == INVALID_FILE_ATTRIBUTES)
      Stop("a download left no file");
    return seconds;
  }
  static std::string Narrow(const std::wstring& text) { return {text.begin(), text.end()}; }
};

Downloads SmallDownloads(const std::wstring& url, int count) {
  Downloads small{url, {}};
  for (int i = 0; i < count; ++i) small.names.push_back(L"small-" + std::to_wstring(i) + L".jpg");
  return small;
}

// Makes the hidden list, which shows the account, and returns the address of the account's folder.
std::wstring MakeHidden(const Account& account) {
  if (FAILED(CoCreateInstance(CLSID_ctrlListImage, nullptr, CLSCTX_INPROC_SERVER, __uuidof(_ctrlListImage),
                              hidden.ReceiveVoid())))
    Stop("the library is not registered");
  std::wstring url = ShowAccount(*hidden, account);
  userFolder = NativePath(UserFolder(url));
  return url;
}

}  // namespace

void TransferBench(const Account& account, std::size_t largeBytes, int smallCount) {
  const std::wstring url = MakeHidden(account);
  const Form form(CLSID_ctrlListImage, {600, 400});
  const ComPtr<_ctrlListImage> visible = form.Control<_ctrlListImage>();
  ShowAccount(*visible, account);
  Native(
      "mkdir library loop copies urlmon library-full loop-full && "
      "for i in $(seq 3000); do echo >library-full/other-$i.jpg; done && cp library-full/* loop-full");

  const Downloads large{url, {L"large.jpg"}};
  const Downloads part{url, {L"part.jpg"}};
  const double peak = PeakBytes([&] { large.ByLibrary(*hidden, L"library"); });
  const double mebibytes = static_cast<double>(largeBytes) / (1 << 20);
  std::vector<Side> sides = {
      {"library", [&] { return large.ByLibrary(*hidden, L"library"); }},
      {"library", [&] { return large.ByLibrary(*visible, L"library"); }},
      {"WinINet loop, CopyFile", [&] { return large.ByLoop(L"loop", true); }},
      {"curl, cp", [&] { return large.ByCurl(); }},
      {"URLDownloadToFile", [&] { return large.ByUrlmon(); }},
      {"WinINet loop alone", [&] { return large.ByLoop(L"loop", false); }},
      {"itself, of 8 MiB", [&] { return part.ByLibrary(*hidden, L"library"); }, mebibytes / 8}};
  Measure(sides);
  const char* const rest =
      "a message and an event for each piece that arrives; two files written beside their names and renamed";
  for (const int ours : {0, 1}) {
    const std::string what = std::string("download of 64 MiB, window ") + (ours == 0 ? "hidden" : "visible");
    const Side& library = sides[static_cast<std::size_t>(ours)];
    Row(what, library, sides[2], ">=1.0", rest);
    Row(what, library, sides[3], ">=0.9", rest);
    Row(what, library, sides[4], ">=3.0", "the peer writes to its cache first and copies from there");
    Row(what, library, sides[5], "", "the copy, which the loop alone does not make");
  }
  Row("download, a MiB of 64", PerUnit(sides[0], mebibytes), sides[6], "<=1.2",
      "a connection and two new files, whatever the size");

  const Downloads small = SmallDownloads(url, smallCount);
  const double files = smallCount;
  std::vector<Side> many = {
      {"library", [&] { return small.ByLibrary(*hidden, L"library"); }, files},
      {"library", [&] { return small.ByLibrary(*hidden, L"library-full"); }, files},
      {"WinINet loop, CopyFile", [&] { return small.ByLoop(L"loop", true); }, files},
      {"WinINet loop, CopyFile", [&] { return small.ByLoop(L"loop-full", true); }, files},
      {"WinINet loop alone", [&] { return small.ByLoop(L"loop", false); }, files},
      {"curl, cp", [&] { return small.ByCurl(); }, files}};
  Measure(many);
  const std::string what = "download, one of 500 of 20 KiB";
  Row(what, many[0], many[2], ">=1.0",
      "look-ups of names that are not there: one more than the peer's, so that an old file cannot pass for "
      "it");
  Row(what, many[0], many[4], "", "the copy, which the loop alone does not make");
  Row(what, many[0], many[5], "", "Wine and its server make hundreds of system calls for a file");
  Row(what + " beside 3,000", many[1], many[3], ">=1.0",
      "look-ups of names that are not there, of which Wine makes a listing of the folder each: two, and a "
      "third meanwhile on another processor, to the peer's one");
  Row("the same, processors that were free", FreeProcessors(), "x", "", "other programs");

  Row("peak memory of a download of 64 MiB, times the file",
      {"library", {}, 1, {peak / static_cast<double>(largeBytes)}}, "x", "<=1.25",
      "the pieces that were received and not written");
  Row("processor time of a download that stalls for 10 s", {"library", {}, 1, {Stall()}}, "s", "<=0.05",
      "none: the wait is for messages");
  hidden = {};
}

void TlsBench(const Account& account, int smallCount) {
  const std::wstring url = MakeHidden(account);
  Native("mkdir library loop copies");
  const Downloads large{url, {L"large.jpg"}};
  const Downloads small = SmallDownloads(url, smallCount);
  const double files = smallCount;
  std::vector<Side> sides = {{"library", [&] { return large.ByLibrary(*hidden, L"library"); }},
                             {"WinINet loop, CopyFile", [&] { return large.ByLoop(L"loop", true); }},
                             {"WinINet loop alone", [&] { return large.ByLoop(L"loop", false); }},
                             {"library", [&] { return small.ByLibrary(*hidden, L"library"); }, files},
                             {"WinINet loop, CopyFile", [&] { return small.ByLoop(L"loop", true); }, files}};
  Measure(sides);
  const std::string what = "download of 64 MiB over TLS";
  Row(what, sides[0], sides[1], ">=0.8", "deciphering, which Wine does on one thread of its own");
  Row(what, sides[0], sides[2], "", "the copy, which the loop alone does not make");
  Row("download, one of 100 of 20 KiB over TLS", sides[3], sides[4], ">=0.8",
      "the handshake is most of both; the library makes a new connection for each file");
  hidden = {};
}

}  // namespace tarnwick::bench
