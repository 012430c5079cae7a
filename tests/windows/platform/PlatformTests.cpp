// Registry, files, string resources and message pump against the real system.
#include <gtest/gtest.h>

#include <functional>

#include "base/RuntimeError.h"
#include "platform/windows/AnsiText.h"
#include "platform/windows/Owner.h"
#include "platform/windows/WindowsPlatform.h"
#include "support/CRegistry.h"

namespace tarnwick {
namespace {

template <typename Body>
std::int32_t ErrorOf(Body body) {
  try {
    body();
    return 0;
  } catch (const RuntimeError& failure) {
    return failure.Number();
  }
}

TEST(AnsiText, ReportsWhatTheCodePageCannotHold) {
  // Windows-1252, as the test systems have it.
  EXPECT_EQ(AnsiFromText(u"Gr\u00FC\u20AC"), "Gr\xFC\x80");
  EXPECT_EQ(TextFromAnsi("Gr\xFC\x80"), u"Gr\u00FC\u20AC");
  EXPECT_EQ(AnsiFromText(u""), "");
  EXPECT_FALSE(AnsiFromText(u"\u65E5"));
  EXPECT_FALSE(AnsiFromText(u"\u0101"));  // would become a plain "a"
  EXPECT_FALSE(AnsiFromText(TextView(u"a\0b", 3)));
}

constexpr TextView kKey = u"Software\\Tarnwick platform test";

class RegistryTest : public testing::Test {
 protected:
  RegistryTest() {
    RegCreateKeyExW(HKEY_CURRENT_USER, WideFromText(kKey).c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                    &key_, nullptr);
  }
  ~RegistryTest() override {
    RegCloseKey(key_);
    RegDeleteKeyW(HKEY_CURRENT_USER, WideFromText(kKey).c_str());
  }

  void Set(const wchar_t* name, DWORD type, const void* data, std::size_t size) {
    RegSetValueExW(key_, name, 0, type, static_cast<const BYTE*>(data), static_cast<DWORD>(size));
  }
  void SetText(const wchar_t* name, const std::wstring& text) {
    Set(name, REG_SZ, text.c_str(), (text.size() + 1) * sizeof(wchar_t));
  }

  HKEY key_ = nullptr;
  WindowsRegistry registry_;
};

TEST_F(RegistryTest, QueriesAsTheSystemDoes) {
  const DWORD number = 42;
  SetText(L"longest", std::wstring(254, L'x') + L"\u00FC");
  SetText(L"too long", std::wstring(256, L'x'));
  SetText(L"", L"default");
  Set(L"number", REG_DWORD, &number, sizeof number);
  Set(L"binary", REG_BINARY, "\1\2\3", 3);

  std::unique_ptr<RegistryKey> key;
  ASSERT_EQ(registry_.Open(kHiveCurrentUser, kKey, key), kRegistrySuccess);
  const struct {
    TextView name;
    DWORD status, type, size;
  } kCases[] = {{u"longest", 0, REG_SZ, 256},
                {u"too long", ERROR_MORE_DATA, REG_SZ, 257},
                {u"", 0, REG_SZ, 8},
                {u"number", 0, REG_DWORD, 4},
                {u"binary", 0, REG_BINARY, 3}};
  for (const auto& item : kCases) {
    std::uint8_t data[256] = {};
    std::uint32_t type = 0;
    std::uint32_t size = 0;
    EXPECT_EQ(key->Query(item.name, type, data, size), item.status) << Utf8FromText(item.name);
    EXPECT_EQ(type, item.type) << Utf8FromText(item.name);
    EXPECT_EQ(size, item.size) << Utf8FromText(item.name);
  }
  std::uint8_t data[256] = "????";
  std::uint32_t type = 0;
  std::uint32_t size = 0;
  for (TextView missing : {u"missing", u"\u65E5"})
    EXPECT_EQ(key->Query(missing, type, data, size), DWORD{ERROR_FILE_NOT_FOUND});

  EXPECT_EQ(registry_.Open(kHiveCurrentUser, Text(kKey) + u"\\none", key), DWORD{ERROR_FILE_NOT_FOUND});
  EXPECT_EQ(registry_.Open(kHiveLocalMachine, u"Software", key), kRegistrySuccess);

  CRegistry settings(registry_);
  settings.setBaseRegKey(kHiveCurrentUser, u"Software");
  EXPECT_EQ(settings.getRegSetting(u"longest", kKey.substr(9), type = 1), Text(254, u'x') + u"\u00FC");
}

class FilesTest : public testing::Test {
 protected:
  FilesTest() : folder_(files_.TempPath() + u"tarnwick-\u65E5") { Remove(), files_.MakeFolder(folder_); }
  ~FilesTest() override { Remove(); }

  Text In(TextView name) const { return folder_ + u"\\" + Text(name); }
  FileOwner Open(TextView name, DWORD access, DWORD share = 0, DWORD how = OPEN_EXISTING) const {
    return FileOwner(CreateFileW(WideFromText(In(name)).c_str(), access, share, nullptr, how, 0, nullptr));
  }
  void Write(TextView name, std::string_view bytes) {
    const FileOwner file = Open(name, GENERIC_WRITE, 0, CREATE_ALWAYS);
    DWORD written = 0;
    WriteFile(file.Get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr);
  }
  std::string Read(TextView name) {
    char bytes[100];
    DWORD size = 0;
    ReadFile(Open(name, GENERIC_READ, FILE_SHARE_READ).Get(), bytes, sizeof bytes, &size, nullptr);
    return {bytes, size};
  }
  // All names in the folder, hidden ones included; with `erase` they go.
  std::size_t Each(bool erase) {
    WIN32_FIND_DATAW found{};
    std::size_t count = 0;
    const FindOwner search(FindFirstFileW(WideFromText(In(u"*")).c_str(), &found));
    for (BOOL more = search ? TRUE : FALSE; more; more = FindNextFileW(search.Get(), &found)) {
      const std::wstring path = WideFromText(In(TextFromWide(found.cFileName)));
      if (found.cFileName[0] == L'.') continue;
      ++count;
      if (!erase) continue;
      SetFileAttributesW(path.c_str(), FILE_ATTRIBUTE_NORMAL);
      if (!DeleteFileW(path.c_str())) RemoveDirectoryW(path.c_str());
    }
    return count;
  }
  void Remove() {
    Each(true);
    RemoveDirectoryW(WideFromText(folder_).c_str());
  }

  WindowsFileSystem files_;
  Text folder_;
};

TEST_F(FilesTest, TellsLengthTimeAndAttributes) {
  Write(u"\u65E5.jpg", "12345");
  const Text path = In(u"\u65E5.jpg");
  EXPECT_EQ(files_.Length(path), 5U);
  for (std::uint32_t bits : {attribute::kReadOnly | attribute::kHidden, attribute::kSystem, 0U}) {
    EXPECT_EQ(ErrorOf([&] { files_.SetAttributes(path, bits | FILE_ATTRIBUTE_COMPRESSED); }), 0);
    // Not every system keeps the archive bit: it may be set always.
    EXPECT_EQ(files_.Attributes(path) & ~attribute::kArchive, bits);
  }
  const SYSTEMTIME noon{2026, 1, 0, 2, 15, 4, 5, 0};
  SYSTEMTIME utc{};
  FILETIME time{};
  TzSpecificLocalTimeToSystemTime(nullptr, &noon, &utc);
  SystemTimeToFileTime(&utc, &time);
  SetFileTime(Open(u"\u65E5.jpg", GENERIC_WRITE).Get(), nullptr, nullptr, &time);
  EXPECT_EQ(files_.ModifiedText(path), u"1/2/2026 3:04:05 PM");

  for (const Text& nothing :
       {In(u"none"), In(u"none\\x"), In(u"*"), folder_, Text(), path + Text(1, u'\0')}) {
    EXPECT_EQ(ErrorOf([&] { files_.Length(nothing); }), 53) << Utf8FromText(nothing);
    EXPECT_EQ(ErrorOf([&] { files_.ModifiedText(nothing); }), 53);
    EXPECT_EQ(ErrorOf([&] { files_.Attributes(nothing); }), 53);
  }
  EXPECT_EQ(ErrorOf([&] { files_.SetAttributes(In(u"none"), 0); }), 75);
}

TEST_F(FilesTest, ListsWhatIsNeitherHiddenNorSystem) {
  EXPECT_FALSE(files_.Exists(In(u"*"), false));
  EXPECT_TRUE(files_.Exists(In(u"*"), true));
  Write(u"a.jpg", "");
  Write(u"b.jpg", "");
  Write(u"c.gif", "");
  files_.SetAttributes(In(u"a.jpg"), attribute::kHidden);
  files_.SetAttributes(In(u"b.jpg"), attribute::kReadOnly);
  files_.SetAttributes(In(u"c.gif"), attribute::kSystem);
  files_.MakeFolder(In(u"folder"));
  const struct {
    Text pattern;
    bool file, withFolders;
  } kCases[] = {{In(u"*.jpg"), true, true},     {In(u"a.jpg"), false, false},   {In(u"*.gif"), false, false},
                {In(u"B.JPG"), true, true},     {In(u"none\\x"), false, false}, {In(u"fold?r"), false, true},
                {In(u"folder\\"), false, true}, {In(u""), true, true},          {Text(), false, false}};
  for (const auto& item : kCases) {
    EXPECT_EQ(files_.Exists(item.pattern, false), item.file) << Utf8FromText(item.pattern);
    EXPECT_EQ(files_.Exists(item.pattern, true), item.withFolders) << Utf8FromText(item.pattern);
  }
  EXPECT_EQ(ErrorOf([&] { files_.MakeFolder(In(u"folder")); }), 58);
  EXPECT_EQ(ErrorOf([&] { files_.MakeFolder(In(u"b.jpg")); }), 58);
  EXPECT_EQ(ErrorOf([&] { files_.MakeFolder(In(u"none\\x")); }), 76);
  EXPECT_EQ(ErrorOf([&] { files_.MakeFolder(In(u"a?")); }), 75);
}

TEST_F(FilesTest, CopiesWholeOrNotAtAll) {
  Write(u"source", "new");
  Write(u"old", "old");
  Write(u"locked", "old");
  Write(u"held", "old");
  files_.SetAttributes(In(u"locked"), attribute::kReadOnly);
  files_.MakeFolder(In(u"folder"));
  FileOwner held = Open(u"held", GENERIC_READ, FILE_SHARE_READ);
  const struct {
    TextView source, destination;
    std::int32_t error;
    const char* content;
  } kCases[] = {{u"source", u"\u65E5", 0, "new"},       {u"folder", u"old", 75, "old"},
                {u"source", u"old", 0, "new"},          {u"source", u"locked", 75, "old"},
                {u"source", u"held", 75, "old"},        {u"source", u"folder", 75, nullptr},
                {u"source", u"none\\file", 75, nullptr}};
  for (const auto& item : kCases) {
    SCOPED_TRACE(Utf8FromText(item.source) + " " + Utf8FromText(item.destination));
    EXPECT_EQ(ErrorOf([&] { files_.Copy(In(item.source), In(item.destination)); }), item.error);
    if (item.content) {
      EXPECT_EQ(Read(item.destination), item.content);
    }
  }
  held = {};

  // The second page of these bytes is not there, so the system writes the first at most.
  SYSTEM_INFO system{};
  GetSystemInfo(&system);
  void* const pages = VirtualAlloc(nullptr, 2 * system.dwPageSize, MEM_RESERVE, PAGE_READWRITE);
  VirtualAlloc(pages, system.dwPageSize, MEM_COMMIT, PAGE_READWRITE);
  const std::string_view torn(static_cast<const char*>(pages), 2 * system.dwPageSize);
  const struct {
    TextView name;
    std::string_view bytes;
    bool isNew;
    std::int32_t error;
    const char* content;
  } kWrites[] = {{u"written", "first", true, 0, "first"},   {u"WRITTEN", "second", false, 0, "second"},
                 {u"written", torn, false, 75, "second"},   {u"torn", torn, false, 75, nullptr},
                 {u"locked", "new", false, 75, "old"},      {u"folder", "new", false, 75, nullptr},
                 {u"none\\file", "new", false, 75, nullptr}};
  for (const auto& item : kWrites) {
    SCOPED_TRACE(Utf8FromText(item.name) + " " + std::to_string(item.bytes.size()));
    EXPECT_EQ(files_.WriteNew(In(item.name), item.bytes), item.isNew);
    EXPECT_EQ(ErrorOf([&] { files_.Write(In(item.name), item.bytes); }), item.error);
    if (item.content) {
      EXPECT_EQ(Read(item.name), item.content);
    }
  }
  VirtualFree(pages, 0, MEM_RELEASE);
  // The current folder is another one before the file is whole.
  std::array<wchar_t, MAX_PATH> before{};
  GetCurrentDirectoryW(MAX_PATH, before.data());
  SetCurrentDirectoryW(WideFromText(folder_).c_str());
  std::unique_ptr<FileWriter> nearby = files_.Create(u"written");
  SetCurrentDirectoryW(before.data());
  nearby->Write("near");
  nearby->Commit();
  nearby.reset();
  EXPECT_EQ(Read(u"written"), "near");
  // What was begun and given up has gone at once.
  std::size_t most = 0;
  for (int i = 0; i < 50; ++i) {
    files_.Create(In(u"given up"));
    most = std::max(most, Each(false));
  }
  EXPECT_EQ(most, 7U) << "a file in between was left over";
}

// Bytes that take long to write.
constexpr std::size_t kWhole = std::size_t{64} << 20;

// The process that the next test ends in the middle of two writes.
TEST(UnfinishedWrite, DISABLED_GoesOnUntilItsEnd) {
  WindowsFileSystem files;
  const Text path = TextFromWide(_wgetenv(L"TARNWICK_UNFINISHED"));
  const std::unique_ptr<FileWriter> file = files.Create(path);
  file->Write("half");
  files.Write(path + u".begun", "");
  while (files.Exists(path + u".begun", false)) Sleep(1);
  const std::string bytes(kWhole, 'x');
  for (;; ErrorOf([&] { files.Remove(path); })) files.WriteNew(path, bytes);
}

TEST_F(FilesTest, RemovesWhatEndedProcessesLeft) {
  SetEnvironmentVariableW(L"TARNWICK_UNFINISHED", WideFromText(In(u"a.jpg")).c_str());
  std::wstring command = GetCommandLineW();
  command += L" --gtest_also_run_disabled_tests --gtest_filter=UnfinishedWrite.*";
  STARTUPINFOW startup{};
  startup.cb = sizeof startup;
  PROCESS_INFORMATION writer{};
  ASSERT_TRUE(CreateProcessW(nullptr, command.data(), nullptr, nullptr, FALSE, 0, nullptr, nullptr, &startup,
                             &writer));
  for (int i = 0; i < 500 && !files_.Exists(In(u"a.jpg.begun"), false); ++i) Sleep(20);
  files_.RemoveLeftovers(folder_);
  EXPECT_EQ(Each(false), 2U) << "what is being written stays";
  files_.Remove(In(u"a.jpg.begun"));
  DWORD refused = 0;
  for (int i = 0; i < 200'000 && refused == 0 && !HasFailure(); ++i) {
    const FileOwner file =
        Open(u"a.jpg", GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE);
    if (file) {
      EXPECT_EQ(GetFileSize(file.Get(), nullptr), kWhole) << "nobody sees a part";
    } else if (GetLastError() != ERROR_FILE_NOT_FOUND) {
      refused = GetLastError();
    }
  }
  EXPECT_NE(refused, 0U);
  TerminateProcess(writer.hProcess, 1);
  WaitForSingleObject(writer.hProcess, INFINITE);
  // Or the second was finished, or made, just now.
  const bool stays = files_.Exists(In(u"a.jpg"), false) && files_.Length(In(u"a.jpg")) % kWhole == 0;
  EXPECT_EQ(Each(false), stays ? 1U : 0U) << "the system removes both";

  const auto beginning = [](DWORD process) {
    wchar_t name[16];
    wsprintfW(name, L"twk%lx", process);
    return TextFromWide(name);
  };
  const Text own = beginning(GetCurrentProcessId());
  const Text ended = beginning(writer.dwProcessId);
  const Text held = ended + u"-1-2.tmp";
  const Text folder = ended + u"-2-1.tmp";
  const Text inner = folder + u"\\" + ended + u"-1-1.tmp";
  const struct {
    Text name;
    bool isOld, stays;
  } kFiles[] = {{own + u"-1-1.tmp", false, true},
                {own + u"-1-2.tmp", true, false},  // of an earlier process with the same number
                {ended + u"-1-1.tmp", false, false},
                {held, false, true},
                {ended + u"-01-1.tmp", false, true},
                {ended + u"-1-1.tmp.tmp", false, true},
                {inner, false, true}};
  files_.MakeFolder(In(folder));
  const FILETIME old{0, 0x01C00000};
  for (const auto& file : kFiles) {
    Write(file.name, "half");
    if (file.isOld) SetFileTime(Open(file.name, GENERIC_WRITE).Get(), &old, nullptr, &old);
  }
  files_.SetAttributes(In(ended + u"-1-1.tmp"), attribute::kReadOnly);
  {
    const std::unique_ptr<FileReader> reader = files_.Open(In(held));
    files_.RemoveLeftovers(folder_);
  }
  for (const auto& file : kFiles)
    EXPECT_EQ(files_.Exists(In(file.name), false), file.stays) << Utf8FromText(file.name);

  files_.Write(In(folder + u"\\a.jpg"), "whole");
  files_.Remove(In(folder + u"\\a.jpg"));
  EXPECT_FALSE(files_.Exists(In(inner), false)) << "the first write in a folder removes them, too";
  DeleteFileW(WideFromText(In(inner)).c_str());
  for (const HANDLE handle : {writer.hThread, writer.hProcess}) CloseHandle(handle);
}

TEST_F(FilesTest, ReadsABeginningAndCreatesWhatIsMissing) {
  Write(u"a.jpg", "12345");
  char room[3];
  EXPECT_EQ(files_.ReadBeginning(In(u"a.jpg"), room), 3U);
  EXPECT_EQ(std::string_view(room, 3), "123");
  files_.SetAttributes(In(u"a.jpg"), attribute::kReadOnly | attribute::kHidden);
  EXPECT_EQ(files_.ReadBeginning(In(u"a.jpg"), room), 3U);
  EXPECT_EQ(files_.ReadBeginning(In(u"\u65E5.jpg"), room), 0U);
  EXPECT_EQ(files_.Length(In(u"\u65E5.jpg")), 0U);
  const FileOwner held = Open(u"\u65E5.jpg", GENERIC_READ);
  for (const Text& name : {In(u"\u65E5.jpg"), folder_, In(Text(u"a\0", 2))})
    EXPECT_EQ(ErrorOf([&] { files_.ReadBeginning(name, room); }), 75) << Utf8FromText(name);
  EXPECT_EQ(ErrorOf([&] { files_.ReadBeginning(In(u"none\\a"), room); }), 76);
}

TEST(WindowsStringResources, ReadsOwnAndLoadedStrings) {
  WindowsStringResources strings(GetModuleHandleW(nullptr));
  wchar_t self[MAX_PATH];
  GetModuleFileNameW(nullptr, self, MAX_PATH);
  auto library = strings.Load(TextFromWide(self));
  ASSERT_TRUE(library);
  const std::function<Text(std::uint16_t)> kSources[] = {
      [&](std::uint16_t identifier) { return strings.OwnString(identifier); },
      [&](std::uint16_t identifier) { return library->String(identifier); }};
  for (const auto& string : kSources) {
    EXPECT_EQ(string(1), u"Speicherplatz f\u00FCr Bilder");
    EXPECT_EQ(string(2).size(), 511U);
    EXPECT_EQ(string(3), u"");
  }
  // A system that gets only the name finds the program beside itself; without its drive it is on the current
  // one.
  const Text full = TextFromWide(self);
  for (const Text& path : {Text(), Text(u"C:\\none.dll"), Text(u"C:\\\u65E5.dll"),
                           full.substr(full.rfind(u'\\') + 1), full.substr(2)})
    EXPECT_FALSE(strings.Load(path)) << Utf8FromText(path);
}

int handled = 0;
bool repeats = false;

LRESULT CALLBACK CountMessages(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message != WM_APP) return DefWindowProcW(window, message, wParam, lParam);
  ++handled;
  if (repeats) PostMessageW(window, WM_APP, 0, 0);
  return 0;
}

TEST(WindowsMessagePump, HandlesWhatWaitsAndPutsQuitBack) {
  WindowsMessagePump pump;
  WNDCLASSW windowClass{};
  windowClass.lpfnWndProc = CountMessages;
  windowClass.lpszClassName = L"Tarnwick pump test";
  RegisterClassW(&windowClass);
  HWND window = CreateWindowExW(0, windowClass.lpszClassName, L"", 0, 0, 0, 0, 0, HWND_MESSAGE, nullptr,
                                nullptr, nullptr);
  ASSERT_TRUE(window);
  for (int i = 0; i < 3; ++i) PostMessageW(window, WM_APP, 0, 0);
  pump.Yield();
  EXPECT_EQ(handled, 3);

  PostMessageW(window, WM_APP, 0, 0);
  PostQuitMessage(7);
  pump.Yield();
  pump.Yield();
  EXPECT_EQ(handled, 4);
  MSG message{};
  ASSERT_TRUE(PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE));
  EXPECT_EQ(message.message, UINT{WM_QUIT});
  EXPECT_EQ(message.wParam, WPARAM{7});

  // A handler that posts its message again does not keep the pump for ever.
  repeats = true;
  PostMessageW(window, WM_APP, 0, 0);
  pump.Yield();
  repeats = false;
  DestroyWindow(window);
}

}  // namespace
}  // namespace tarnwick
